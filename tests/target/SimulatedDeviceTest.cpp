// The simulated device's own tests: it has to be strict before it can catch anybody else.

#include "target/simulated/SimulatedDevice.h"

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <numeric>

#include "target/simulated/Contents.h"
#include "target/simulated/options/DeviceClass.h"

namespace {

using namespace std::chrono_literals;
using Bytes = std::vector<std::uint8_t>;

constexpr std::uint32_t kFlashAddress = 0x400FD000;
constexpr std::uint32_t kFlashCommand = 0x400FD008;
constexpr std::uint32_t kClock = 0x400FE060;
constexpr std::uint32_t kUser0 = 0x400FE1E0;
constexpr std::uint32_t kStatus[] = {0x2000100C, 0x2000101C};
constexpr std::uint32_t kBusy = 0xFFFFFFFF;
constexpr char kLoader[] = "FlashLoaderMerrow.out";

// A device under a clock that stands still, and the few things that a debugger does with it.
struct DebuggedDevice {
    explicit DebuggedDevice(const std::string& options = "tolva", bool setUp = true)
        : device(target::ParseDeviceOptions(options), &clock) {
        device.Halt();
        if (setUp) SetUp();
    }

    // What the class wants before its flash is worked on.
    void SetUp() {
        if (target::NeedsFlashSetUp(device.Options())) {
            SetWord(0x400FE140, 7);
            device.Pause(16);
            SetClock({0x01803FF3, 0x01803F80, 0x07803F82});
            device.Pause(16);
        } else if (device.Options().className == "quen") {
            SetWord(0x400FD0FC, 3);
            SetWord(0x400AE2C0, 0);
            SetWord(0x400FD0FC, 0);
        }
    }

    // Bypass, source and divider.
    void SetClock(const std::array<std::uint32_t, 3>& words) {
        SetWord(kClock, words[0]);
        SetWord(0x400FE058, 0x40);
        for (const std::uint32_t word : {words[1], words[1], words[2], words[2]})
            SetWord(kClock, word);
    }

    std::uint32_t Word(std::uint32_t address) {
        std::uint32_t value = 0;
        device.Read(&value, 1, address, 1, 4);
        return value;
    }
    void SetWord(std::uint32_t address, std::uint32_t value) {
        device.Write(&value, 1, address, 1, 4);
    }
    void Command(std::uint32_t address, std::uint32_t command) {
        SetWord(kFlashAddress, address);
        device.Pause(4);
        SetWord(kFlashCommand, command);
    }
    void StartLoader() {
        device.LoadProgram(kLoader, "anywhere/");
        device.Run();
    }
    void HandOver(int block, std::uint32_t address, const Bytes& bytes) {
        const auto index = static_cast<std::uint32_t>(block);
        device.Write(bytes.data(), bytes.size(), 0x20000000 + index * 0x800, 1, 1);
        const std::uint32_t parameters[] = {address, static_cast<std::uint32_t>(bytes.size()),
                                            kBusy};
        device.Write(parameters, 12, 0x20001004 + index * 0x10, 1, 1);
    }
    void Program(std::uint32_t address) {
        if (!device.IsRunning()) StartLoader();
        HandOver(0, address, Bytes(128, 0));
        device.Pause(1);
    }
    void HoldPeripherals(std::uint32_t value) {
        for (const std::uint32_t address : {0x400FE040U, 0x400FE044U, 0x400FE048U})
            SetWord(address, value);
    }
    Bytes Flash(std::uint32_t address, std::size_t size) {
        Bytes bytes(size);
        device.Read(bytes.data(), size, address, 0, 1);
        return bytes;
    }

    // What is there, whatever reads there.
    Bytes Cells(std::uint32_t address, std::size_t size) const {
        Bytes bytes(size);
        device.Flash().Read(address, bytes);
        return bytes;
    }

    target::ManualClock clock;
    target::SimulatedDevice device;
};

Bytes Pattern(std::size_t size) {
    Bytes bytes(size);
    std::iota(bytes.begin(), bytes.end(), std::uint8_t{1});
    return bytes;
}

std::string ErrorOf(const std::function<void()>& action) {
    try {
        action();
    } catch (const std::exception& error) {
        return error.what();
    }
    return "no error";
}

TEST(Rules, RefusedAccessNamesTheRule) {
    const struct {
        const char* text;
        std::function<void(DebuggedDevice&)> access;
    } cases[] = {
        {"0x400FD000 on page 2: the device has the pages 0 (flash) and 1 (everything) [page]",
         [](DebuggedDevice& r) { r.device.Read(nullptr, 1, 0x400FD000, 2, 4); }},
        {"[page]", [](DebuggedDevice& r) { r.device.Read(nullptr, 1, 0x400FE000, 0, 4); }},
        {"[access-width]", [](DebuggedDevice& r) { r.device.Read(nullptr, 1, 0x400FE000, 1, 2); }},
        {"[access-width]", [](DebuggedDevice& r) { r.device.Read(nullptr, 1, 0x20000000, 1, 0); }},
        {"[aligned-access]",
         [](DebuggedDevice& r) { r.device.Read(nullptr, 1, 0x400FE002, 1, 4); }},
        {"[aligned-access]",
         [](DebuggedDevice& r) { r.device.Write(nullptr, 1, 0x20000001, 1, 2); }},
        {"[mapped-address]", [](DebuggedDevice& r) { r.Flash(0x3FFFF, 2); }},
        {"[mapped-address]",
         [](DebuggedDevice& r) { r.device.Read(nullptr, SIZE_MAX, 0x100, 0, 4); }},
        {"class tolva has no memory and no register at 0x400FE070 [mapped-address]",
         [](DebuggedDevice& r) { r.Word(0x400FE070); }},
        {"[read-only-register]", [](DebuggedDevice& r) { r.SetWord(0x400FE1D0, 0); }},
        {"[flash-read-only]", [](DebuggedDevice& r) { r.device.Write("x", 1, 0, 1, 1); }},
        {"[known-command]", [](DebuggedDevice& r) { r.SetWord(kFlashCommand, 0xA4420006); }},
        {"[one-command]",
         [](DebuggedDevice& r) {
             r.Command(0, 0xA4420002);
             r.SetWord(kFlashCommand, 0xA4420002);
         }},
        {"[flash-busy]",
         [](DebuggedDevice& r) {
             r.Command(0, 0xA4420002);
             r.Flash(0x8000, 1);
         }},
        {"[flash-busy]",
         [](DebuggedDevice& r) {
             r.StartLoader();
             r.HandOver(0, 0, Pattern(128));
             r.Flash(0x8000, 1);
         }},
        {"[flash-busy]",
         [](DebuggedDevice& r) {
             r.StartLoader();
             r.HandOver(0, 0, Pattern(128));
             r.SetWord(kFlashAddress, 0);
         }},
        {"[halted-for-erase]",
         [](DebuggedDevice& r) {
             r.StartLoader();
             r.Command(0, 0xA4420004);
         }},
        {"the flash address register holds 0x00000200, which is not the start of a 0x400-byte "
         "sector of the 0x40000-byte flash [sector-address]",
         [](DebuggedDevice& r) { r.Command(0x200, 0xA4420002); }},
        {"[sector-address]", [](DebuggedDevice& r) { r.Command(0x40000, 0xA4420002); }},
        {"[commit-address]", [](DebuggedDevice& r) { r.Command(0x80000002, 0xA4420008); }},
        {"[loaded-for-run]", [](DebuggedDevice& r) { r.device.Run(); }},
        {"[loaded-for-run]",
         [](DebuggedDevice& r) {
             r.device.LoadProgram(kLoader, "");
             r.device.Reset(true);
             r.device.Run();
         }},
        {"[known-program]", [](DebuggedDevice& r) { r.device.LoadProgram("other.out", "d/"); }},
        {"[halted-for-load]",
         [](DebuggedDevice& r) {
             r.StartLoader();
             r.StartLoader();
         }},
        {"[halted-for-run]",
         [](DebuggedDevice& r) {
             r.StartLoader();
             r.device.Run();
         }},
        {"[buffer-in-use]",
         [](DebuggedDevice& r) {
             r.StartLoader();
             r.HandOver(0, 0, Pattern(128));
             r.HandOver(0, 0x80, Pattern(128));
         }},
    };
    for (const auto& [text, access] : cases) {
        DebuggedDevice debugged;
        const std::string error = ErrorOf([&, &run = access] { run(debugged); });
        EXPECT_TRUE(error.ends_with(text)) << error << " instead of " << text;
        EXPECT_EQ(debugged.device.Violations(), std::vector{error});
    }
}

TEST(WriteKey, WrongOneDoesNothing) {
    const struct {
        const char* options;
        std::uint32_t right, wrong;
    } cases[] = {{"tolva,keyconfig=FFFFFFEF", 0xA442, 0x71D5},
                 {"pell,keyconfig=FFFFFFEF", 0xA442, 0x71D5},
                 {"quen", 0xA442, 0x71D5},
                 {"quen,keyconfig=0", 0xA442, 0x71D5},
                 {"quen,keyconfig=FFFFFFEF", 0x71D5, 0xA442},
                 {"velk", 0x71D5, 0xA442},
                 {"dorna,keyconfig=0x10", 0xA442, 0x71D5},
                 {"dorna", 0x71D5, 0}};
    for (const auto& [options, right, wrong] : cases) {
        DebuggedDevice debugged(options);
        debugged.device.Flash().Preset(0x4000, Bytes{0});
        for (const std::uint32_t key : {wrong, right}) {
            for (const std::uint32_t command : {2U, 4U, 8U}) {
                debugged.SetWord(kUser0, command);
                debugged.Command(command == 8   ? 0x80000000
                                 : command == 4 ? 0
                                                : 0x4000,
                                 key << 16 | command);
                if (command != 8) debugged.device.Pause(2 * command);  // shows by then
                EXPECT_EQ(debugged.Word(kFlashCommand), key == right ? command : 0) << options;
                debugged.device.Pause(100);
                EXPECT_EQ(debugged.Word(kFlashCommand), 0U) << options;
            }
            EXPECT_EQ(debugged.Flash(0x4000, 1)[0], key == right ? 0xFF : 0) << options;
            EXPECT_EQ(debugged.device.CommittedUserRegisters()[0], key == right ? 8 : kBusy)
                << options;
        }
        EXPECT_EQ(debugged.device.Violations().size(), 3U);
    }
}

// Each wait as long as it has to be is kept, and a millisecond less breaks its rule and no other.
TEST(Rules, WaitsAreExact) {
    const struct {
        const char* rule;
        const char* device;
        std::uint32_t waitMs;
        std::function<void(DebuggedDevice&)> before, after;
    } cases[] = {
        {"timing-set-up", "tolva", 16, [](DebuggedDevice& r) { r.SetWord(0x400FE140, 7); },
         [](DebuggedDevice& r) { r.SetWord(kClock, 0x07803F82); }},
        {"clock-settling", "pell", 16, [](DebuggedDevice& r) { r.SetWord(kClock, 0); },
         [](DebuggedDevice& r) { r.SetWord(kFlashAddress, 0); }},
        {"address-set-up", "pell", 4, [](DebuggedDevice& r) { r.SetWord(kFlashAddress, 0); },
         [](DebuggedDevice& r) { r.SetWord(kFlashCommand, 0xA4420002); }},
        {"status-delay", "pell", 4, [](DebuggedDevice& r) { r.Command(0, 0xA4420002); },
         [](DebuggedDevice& r) { r.Word(kFlashCommand); }},
        {"status-delay", "pell", 8, [](DebuggedDevice& r) { r.Command(0, 0xA4420004); },
         [](DebuggedDevice& r) { r.Word(kFlashCommand); }},
        {"erase-recovery", "pell,erase-time=7ms", 7 + 4,
         [](DebuggedDevice& r) { r.Command(0, 0xA4420002); },
         [](DebuggedDevice& r) { r.SetWord(kFlashAddress, 0); }},
        {"block-write", "mesk", 8, [](DebuggedDevice& r) { r.SetWord(0x400FE40C, 0); },
         [](DebuggedDevice& r) { r.SetWord(0x400FE408, 0); }},
        {"reset-recovery", "pell", 4, [](DebuggedDevice& r) { r.device.Reset(true); },
         [](DebuggedDevice& r) { r.SetWord(0x400FE048, kBusy); }},
        {"peripheral-reset", "pell", 4,
         [](DebuggedDevice& r) {
             r.device.Reset(true);
             r.device.Pause(4);
             r.HoldPeripherals(kBusy);
         },
         [](DebuggedDevice& r) {
             r.HoldPeripherals(0);
             r.Command(0, 0xA4420002);
         }},
        {"rom-alias", "pell", 8,
         [](DebuggedDevice& r) {
             r.device.Reset(false);
             r.SetWord(0x400FE0F0, 1);
         },
         [](DebuggedDevice& r) { r.Program(0x7F80); }},
        {"erase-settling", "ravik,erase-time=7ms", 40,
         [](DebuggedDevice& r) {
             r.device.Flash().Preset(0x400, Bytes(0x400, 0xAA));
             r.Command(0x400, 0xA4420002);
             r.device.Pause(7);
             r.device.Reset(false);
         },
         [](DebuggedDevice& r) { r.Program(0x780); }},
    };
    for (const auto& [rule, device, waitMs, before, after] : cases) {
        for (const bool enough : {false, true}) {
            SCOPED_TRACE(testing::Message() << rule << " " << waitMs << " " << enough);
            DebuggedDevice debugged(device + std::string(",latency=0,bandwidth=0"));
            before(debugged);
            debugged.device.Pause(enough ? waitMs : waitMs - 1);
            after(debugged);
            const auto broken = debugged.device.TakeViolations();
            EXPECT_EQ(broken.empty(), enough);
            for (const std::string& text : broken)
                EXPECT_TRUE(text.ends_with(std::string("[") + rule + "]")) << text;
        }
    }
}

// Every bit of every word counts, but for the fields of the divider before that is set.
TEST(Rules, ClockTakesExactWords) {
    for (std::size_t word = 0; word < 3; ++word) {
        for (int bit = 0; bit < 32; ++bit) {
            DebuggedDevice debugged("ravik", false);
            debugged.SetWord(0x400FE140, 7);
            debugged.device.Pause(16);
            std::array<std::uint32_t, 3> words = {0x01803FF3, 0x01803F80, 0x07803F82};
            words[word] ^= 1U << bit;
            debugged.SetClock(words);
            debugged.device.Pause(16);
            debugged.Command(0, 0xA4420002);
            const bool free = word == 1 && (0x079E0000 >> bit & 1) != 0;
            EXPECT_EQ(debugged.device.Violations().empty(), free) << word << " " << bit;
        }
    }
}

TEST(Rules, WatchdogsAreResetAtAnyTime) {
    DebuggedDevice debugged("pell");
    debugged.device.Reset(true);
    debugged.SetWord(0x400FE040, 0x10000008);
    debugged.device.Pause(4);
    debugged.HoldPeripherals(kBusy);
    debugged.device.Pause(4);
    debugged.HoldPeripherals(0);
    debugged.SetWord(0x400FE040, 0x10000008);
    debugged.Command(0, 0xA4420002);
    EXPECT_EQ(debugged.device.Violations(), std::vector<std::string>());
}

// Of what was erased too short a time before, only the pages that are programmed come back.
TEST(Erase, IsUndoneForThePagesInUse) {
    for (const std::uint32_t address : {0x780U, 0x800U}) {
        DebuggedDevice debugged("ravik");
        debugged.device.Flash().Preset(0x400, Bytes(0x800, 0xAA));
        for (const std::uint32_t sector : {0x400U, 0x800U}) {
            debugged.Command(sector, 0xA4420002);
            debugged.device.Pause(12);
        }
        debugged.device.Reset(false);
        debugged.Program(address);
        EXPECT_EQ(debugged.Cells(0x700, 1)[0], address == 0x780 ? 0xAA : 0xFF);
        EXPECT_EQ(debugged.Cells(0x900, 1)[0], address == 0x780 ? 0xFF : 0xAA);
    }
}

TEST(Registers, AreTransferredInARow) {
    DebuggedDevice debugged("mesk");
    const std::uint32_t words[] = {0x11, 0x22};
    debugged.device.Write(words, 2, kUser0, 1, 4);
    std::uint32_t read[2] = {};
    debugged.device.Read(read, 2, kUser0, 1, 4);
    EXPECT_TRUE(std::equal(std::begin(words), std::end(words), read));
}

TEST(Erase, TakesPollsAndKeepsToItsSector) {
    DebuggedDevice debugged("velk,sector=2K");
    debugged.device.Flash().Preset(0, Bytes(0x3000, 0));
    const auto polls = [&debugged](std::uint32_t address, std::uint32_t command,
                                   std::uint32_t pauseMs) {
        debugged.Command(address, command);
        int busy = 0;
        for (debugged.device.Pause(pauseMs); debugged.Word(kFlashCommand) != 0; ++busy) {
            debugged.device.Pause(pauseMs);
        }
        return busy;
    };
    EXPECT_EQ(polls(0x800, 0x71D50002, 5), 1);
    Bytes expected(0x3000, 0);
    std::fill_n(expected.begin() + 0x800, 0x800, std::uint8_t{0xFF});
    EXPECT_EQ(debugged.Flash(0, 0x3000), expected);
    EXPECT_EQ(polls(0x20000, 0x71D50004, 10), 5);
    EXPECT_EQ(debugged.device.FlashContents(), Bytes(0x80000, 0xFF));
}

TEST(Erase, MeskNeedsItsBlocksBeyondTheFlashCleared) {
    const struct {
        const char* flash;
        std::uint32_t blocks[4];
        bool erases;
    } cases[] = {{"32K", {0xFFFF, 0, 0, 0}, true},
                 {"32K", {0x1FFFF, 0, 0, 0}, false},
                 {"64K", {kBusy, 0, 0, 0}, true},
                 {"64K", {kBusy, 1, 0, 0}, false},
                 {"96K", {kBusy, 0xFFFF, 0, 0}, true},
                 {"96K", {kBusy, kBusy, 0, 0}, false},
                 {"128K", {kBusy, kBusy, 0, 0}, true},
                 {"128K", {0, 0, 0, 0x80000000}, false},
                 {"256K", {kBusy, kBusy, kBusy, kBusy}, true}};
    for (const auto& c : cases) {
        DebuggedDevice debugged(std::string("mesk,flash=") + c.flash);
        for (std::uint32_t i = 0; i < 4; ++i) {
            debugged.SetWord(0x400FE400 + 4 * i, c.blocks[i]);
            debugged.device.Pause(8);
        }
        debugged.Command(0, 0xA4420004);
        debugged.device.Pause(8);
        EXPECT_EQ(debugged.Word(kFlashCommand) == 4, c.erases) << c.flash;
        EXPECT_EQ(debugged.device.Violations().empty(), c.erases);
    }
}

TEST(Loader, ProgramsOneChunkWhileTheNextIsTransferred) {
    DebuggedDevice debugged;
    const Bytes image = Pattern(5 * 2048 + 128);
    debugged.StartLoader();
    EXPECT_EQ(debugged.Word(kStatus[1]), 0U);
    int block = 0;
    for (std::uint32_t offset = 0; offset < image.size(); offset += 2048, block ^= 1) {
        const auto end = std::min<std::ptrdiff_t>(offset + 2048, std::ssize(image));
        debugged.HandOver(block, 0x1000 + offset,
                          Bytes(image.begin() + offset, image.begin() + end));
        EXPECT_EQ(debugged.Word(kStatus[block]), kBusy);
        EXPECT_EQ(debugged.Word(kStatus[block ^ 1]), 0U) << "a poll found a default loader busy";
    }
    debugged.device.Pause(1);
    EXPECT_EQ(debugged.Flash(0x1000, image.size()), image);
    EXPECT_EQ(debugged.device.LoaderBusyTime(), 6 * 200us);
    EXPECT_TRUE(debugged.device.Violations().empty());
}

TEST(Loader, ServesTheBlocksInTurnOnTheInjectedClock) {
    DebuggedDevice debugged("tolva,chunk-time=10ms,latency=0,bandwidth=0");
    debugged.StartLoader();
    debugged.HandOver(1, 0x800, Pattern(128));  // must wait for block 0
    debugged.clock.Advance(1s);
    debugged.HandOver(0, 0, Pattern(128));
    std::vector<std::array<std::uint32_t, 2>> seen;
    for (const auto step : {0us, 9999us, 2us, 9999us}) {
        debugged.clock.Advance(step);
        seen.push_back({debugged.Word(kStatus[0]), debugged.Word(kStatus[1])});
    }
    EXPECT_EQ(seen, (decltype(seen){{kBusy, kBusy}, {kBusy, kBusy}, {0, kBusy}, {0, 0}}));
}

TEST(Loader, HaltAndResetLoseTheChunkAtWork) {
    for (const bool reset : {false, true}) {
        DebuggedDevice debugged;
        debugged.StartLoader();
        debugged.HandOver(0, 0, Bytes(256, 0));
        if (reset) {
            debugged.device.Reset(false);
        } else {
            debugged.device.Halt();
        }
        debugged.device.Pause(1000);
        Bytes expected(256, 0xFF);
        std::fill_n(expected.begin(), 128, std::uint8_t{0});
        EXPECT_EQ(debugged.Cells(0, 256), expected);
        EXPECT_EQ(debugged.Word(kStatus[0]), kBusy);
    }
}

TEST(Loader, SaysWhatItCannotTellTheDebugger) {
    const struct {
        std::uint32_t address, size;
        const char* rule;
    } cases[] = {{0x40, 128, "[loader-parameters]"},
                 {0, 64, "[loader-parameters]"},
                 {0, 0, "[loader-parameters]"},
                 {0x3FF80, 256, "[loader-parameters]"},
                 {kBusy - 127, 128, "[loader-parameters]"},
                 {0x400, 128, "[erased-cells]"}};
    for (const auto& [address, size, rule] : cases) {
        DebuggedDevice debugged;
        debugged.device.Flash().Preset(0x410, Bytes{0xF0});
        debugged.StartLoader();
        debugged.HandOver(0, address, Bytes(size, 0x3C));
        debugged.device.Pause(1);
        EXPECT_NE(debugged.Word(kStatus[0]), kBusy);
        ASSERT_EQ(debugged.device.Violations().size(), 1U);
        EXPECT_TRUE(debugged.device.Violations()[0].ends_with(rule))
            << debugged.device.Violations()[0];
        EXPECT_EQ(debugged.Flash(0x410, 1)[0], address == 0x400 ? 0x30 : 0xF0);
    }
}

TEST(UserRegisters, AreVolatileUntilCommitted) {
    DebuggedDevice debugged;
    const auto values = [&debugged] {
        return std::array{debugged.Word(kUser0), debugged.Word(kUser0 + 4)};
    };
    debugged.SetWord(kUser0, 0x11);
    debugged.SetWord(kUser0 + 4, 0x22);
    debugged.Command(0x80000001, 0xA4420008);
    debugged.device.Pause(1);
    EXPECT_EQ(values(), (std::array{0x11U, 0x22U}));
    debugged.device.Reset(true);
    EXPECT_EQ(values(), (std::array{kBusy, 0x22U}));
    debugged.Command(0x80000000, 0xA4420008);
    debugged.SetWord(kUser0 + 4, 0x33);
    debugged.device.PowerCycle();
    EXPECT_EQ(values(), (std::array{kBusy, 0x22U}));
}

TEST(Faults, ComeAsAsked) {
    DebuggedDevice once("tolva,fail-access=3", false);  // the device's halt is the first
    EXPECT_EQ(once.Word(0x400FE000), 0x10010100U);
    EXPECT_EQ(ErrorOf([&] { once.Word(0x400FE000); }),
              "Reading 1 x 4 bytes at 0x400FE000 on page 1: the connection to the target failed at "
              "access 3 [fail-access]");
    EXPECT_EQ(once.Word(0x400FE000), 0x10010100U);

    DebuggedDevice fromThen("tolva,fail-from=2", false);
    for (int i = 0; i < 3; ++i)
        EXPECT_TRUE(ErrorOf([&] { fromThen.device.Run(); }).ends_with("[fail-from]"));

    DebuggedDevice never("tolva,erase=never,commit=never");
    for (const auto& [address, command] : {std::pair{0U, 2U}, {0U, 4U}, {0x80000000U, 8U}}) {
        never.Command(address, 0xA4420000 | command);
        never.device.Pause(0xFFFFFFFF);
        EXPECT_EQ(never.Word(kFlashCommand), command);
        never.device.Reset(false);
    }

    DebuggedDevice stuck("tolva,stuck-cell=0x1003:0x5A");
    EXPECT_EQ(stuck.Flash(0x1002, 3), (Bytes{0xFF, 0x5A, 0xFF}));

    DebuggedDevice ones("tolva,registers=ones"), zeros("tolva,registers=zeros");
    EXPECT_EQ(ones.Word(kFlashCommand), kBusy);
    EXPECT_EQ(zeros.Word(0x400FDFC0), 0U);
    ones.device.Flash().Preset(0, Bytes{0});
    ones.SetWord(kFlashCommand, 0xA4420004);
    ones.device.Pause(1000);
    EXPECT_EQ(ones.Flash(0, 1), Bytes{0}) << "a write came through";

    for (const auto& [options, idle] :
         {std::pair{"tolva,loader=hangs", 0U}, {"tolva,loader=dead", kBusy}}) {
        DebuggedDevice debugged(options);
        debugged.StartLoader();
        EXPECT_EQ(debugged.Word(kStatus[1]), idle);
        debugged.HandOver(0, 0, Pattern(128));
        debugged.device.Pause(60'000);
        EXPECT_EQ(debugged.Word(kStatus[0]), kBusy);
    }
}

TEST(Time, CannotBeWaitedIntoAnOverflow) {
    DebuggedDevice debugged;
    for (int i = 0; i < 5000; ++i)
        debugged.device.Pause(0xFFFFFFFF);
    debugged.Command(0, 0xA4420002);
    debugged.clock.Advance(1s);
    EXPECT_EQ(debugged.Word(kFlashCommand), 0U);
}

TEST(Options, BadOnesAreNamed) {
    const struct {
        const char* text;
        const char* error;
    } cases[] = {
        {"", "Device class \"\" of the simulated device: use one of ravik, tolva"},
        {"Tolva", "Device class \"Tolva\""},
        {"tolva,color=red", "Option \"color=red\" of the simulated device: the form is NAME=VALUE"},
        {"tolva,flash", "Option \"flash\""},
        {"tolva,flash=3K", "Option \"flash=3K\" of the simulated device: accepted is a multiple"},
        {"tolva,flash=129M", "Option \"flash=129M\""},
        {"tolva,flash=99999999999999999M", "Option \"flash="},
        {"tolva,flash=4K,flash=4K", "Option \"flash=4K\" of the simulated device: the option is"},
        {"tolva,sector=2K", "Option \"sector=2K\" of the simulated device: a tolva has sectors"},
        {"dorna,sector=3K", "Option \"sector=3K\""},
        {"velk,revision=256", "Option \"revision=256\""},
        {"velk,id=1,revision=A", "Option \"id=0x00000001\""},
        {"quen,keyconfig=100000000", "Option \"keyconfig=100000000\""},
        {"quen,erase-time=5", "Option \"erase-time=5\""},
        {"quen,erase-time=2h", "Option \"erase-time=2h\""},
        {"quen,erase-time=18446744074s", "Option \"erase-time=18446744074s\""},    // wraps to 0.3 s
        {"quen,flash=18014398509482048K", "Option \"flash=18014398509482048K\""},  // to 64K
        {"quen,fail-access=0", "Option \"fail-access=0\""},
        {"quen,erase=maybe", "Option \"erase=maybe\""},
        {"quen,stuck-cell=512K", "Option \"stuck-cell=512K\""},
        {"quen,stuck-cell=80000", "the flash ends at 0x80000."},
    };
    for (const auto& [text, expected] : cases) {
        const std::string error =
            ErrorOf([&, &t = text] { target::SimulatedDevice(target::ParseDeviceOptions(t)); });
        EXPECT_NE(error.find(expected), std::string::npos) << error;
    }
}

std::unique_ptr<target::SimulatedDevice> Decode(const std::string& contents,
                                                const std::string& options) {
    return target::DecodeContents(contents, target::ParseDeviceOptions(options));
}

TEST(Contents, KeepTheDevice) {
    target::SimulatedDevice kept(
        target::ParseDeviceOptions("dorna,flash=128M,sector=1K,revision=2,erase-time=1us"));
    kept.Flash().Preset(0x7FFFF80, Pattern(128));
    kept.PresetCommittedUserRegisters({0x00C31B02, 0x00060504});
    const std::string contents = EncodeContents(kept);
    EXPECT_LT(contents.size(), 2048U);
    auto device = target::DecodeContents(contents, target::DefaultDeviceOptions());
    EXPECT_EQ(DefinitionText(device->Options()),
              "dorna,id=0x901A0200,flash=128M,ram=256K,sector=1K,keyconfig=0xFFFFFFEF");
    EXPECT_EQ(device->Options().timings.sectorErase, 8ms);
    EXPECT_EQ(device->CommittedUserRegisters(), (std::array{0x00C31B02U, 0x00060504U}));
    Bytes expected(0x8000000, 0xFF);
    std::copy_n(Pattern(128).begin(), 128, expected.end() - 128);
    EXPECT_TRUE(device->FlashContents() == expected);

    // All its sectors, one by one: the work per access must not grow with the flash.
    device->Halt();
    for (std::uint32_t address = 0; address < 0x8000000; address += 0x400) {
        const std::uint32_t command = 0x71D50002;
        device->Write(&address, 1, kFlashAddress, 1, 4);
        device->Pause(4);
        device->Write(&command, 1, kFlashCommand, 1, 4);
        device->Pause(12);
    }
    EXPECT_TRUE(device->FlashContents() == Bytes(0x8000000, 0xFF));
}

TEST(Contents, AreRefusedWhenTheyAreNoDevice) {
    target::SimulatedDevice device(target::DefaultDeviceOptions());
    device.Flash().Preset(0, Bytes{0});
    const std::string good = EncodeContents(device);
    const auto refused = [](const std::string& contents, const char* why) {
        const std::string error = ErrorOf([&] { Decode(contents, "tolva"); });
        EXPECT_NE(error, "no error");
        EXPECT_NE(error.find(why), std::string::npos) << error;
    };
    for (std::size_t size = 0; size < good.size(); ++size)
        refused(good.substr(0, size), "");
    for (std::size_t i = 0; i < good.size(); ++i) {
        std::string flipped = good;
        flipped[i] = static_cast<char>(flipped[i] ^ 0x10);
        refused(flipped, i < 8 ? "no simulated device" : i < 12 ? "version" : "checksum");
    }
    refused(good + "x", "checksum");
    EXPECT_EQ(Decode(good, "tolva")->FlashContents(), device.FlashContents());
}

TEST(Contents, MustAgreeWithTheOptions) {
    // A class without user registers has none to fill.
    const std::string ravik =
        EncodeContents(target::SimulatedDevice(target::ParseDeviceOptions("ravik")));
    EXPECT_EQ(Decode(ravik, "ravik")->CommittedUserRegisters(),
              (std::array{0xFFFFFFFFU, 0xFFFFFFFFU}));
    const std::string contents = EncodeContents(
        target::SimulatedDevice(target::ParseDeviceOptions("velk,flash=1M,revision=B")));
    const struct {
        const char* options;
        const char* error;
    } cases[] = {
        {"velk,flash=0x100000,sector=4096,fail-access=7,stuck-cell=fffff", "no error"},
        {"dorna",
         "Option \"class\" of the simulated device: dorna is asked for, but the kept device has "
         "velk;"},
        {"velk,flash=256K",
         "Option \"flash\" of the simulated device: 256K is asked for, but the kept device has "
         "1M;"},
        {"velk,stuck-cell=100000",
         "Option \"stuck-cell=0x00100000\" of the simulated device: the flash ends at 0x100000."},
        {"velk,revision=A",
         "Option \"revision\" of the simulated device: 0 is asked for, but the kept device has 1;"},
    };
    for (const auto& [options, expected] : cases) {
        const std::string error = ErrorOf([&, &o = options] { Decode(contents, o); });
        EXPECT_TRUE(error.starts_with(expected)) << error;
    }
}

}  // namespace
