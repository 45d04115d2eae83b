// The simulated device's own tests: it has to be strict before it can catch anybody else.

#include "target/simulated/SimulatedDevice.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <map>
#include <memory>
#include <numeric>
#include <optional>
#include <sstream>

#include "target/simulated/Contents.h"
#include "target/simulated/options/DeviceClass.h"
#include "tests/support/Cases.h"

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
            device.Pause(16ms);
            SetClock({0x01803FF3, 0x01803F80, 0x07803F82});
            device.Pause(16ms);
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
        device.Pause(4ms);
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
        device.Pause(1ms);
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

    void EraseBlocks(const std::vector<std::uint64_t>& blocks) {
        for (std::uint32_t i = 0; i < blocks.size(); ++i) {
            SetWord(0x400FE400 + 4 * i, static_cast<std::uint32_t>(blocks[i]));
            device.Pause(8ms);
        }
        Command(0, 0xA4420004);
        device.Pause(8ms);
    }

    // That this rule was broken, and no other.
    void ExpectBroken(const std::string& rule) {
        const auto broken = device.TakeViolations();
        EXPECT_FALSE(broken.empty()) << rule;
        for (const std::string& text : broken)
            EXPECT_TRUE(text.ends_with("[" + rule + "]")) << text;
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

/// What stands behind a step's name, and behind its "=".
struct Arguments {
    std::string text;
    std::vector<std::uint64_t> numbers = {};
    std::optional<std::uint32_t> expected = {};

    std::uint32_t operator[](std::size_t index) const {
        return static_cast<std::uint32_t>(numbers.at(index));
    }
    int Int(std::size_t index) const { return static_cast<int>(numbers.at(index)); }
};

/// The byte that all of them are.
std::uint32_t Same(const Bytes& bytes) {
    return std::ranges::count(bytes, bytes[0]) == std::ssize(bytes) ? bytes[0] : 0x100;
}

/// A step's name and what it does. It gives what it has found.
using Step = std::uint32_t (*)(DebuggedDevice& d, const Arguments& a);

const std::map<std::string, Step> kSteps = {
    {"read",
     [](auto& d, auto& a) {
         return d.device.Read(nullptr, a.numbers.at(1), a[0], a.Int(2), a[3]), 0U;
     }},
    {"write",
     [](auto& d, auto& a) { return d.device.Write(nullptr, a[1], a[0], a.Int(2), a[3]), 0U; }},
    {"word", [](auto& d, auto& a) { return d.Word(a[0]); }},
    {"set", [](auto& d, auto& a) { return d.SetWord(a[0], a[1]), 0U; }},
    {"command", [](auto& d, auto& a) { return d.Command(a[0], a[1]), 0U; }},
    {"pause", [](auto& d, auto& a) { return d.device.Pause(a[0] * 1ms), 0U; }},
    {"clock", [](auto& d, auto& a) { return d.clock.Advance(a[0] * 1us), 0U; }},
    {"preset",
     [](auto& d, auto& a) {
         return d.device.Flash().Preset(a[0], Bytes(a[1], static_cast<std::uint8_t>(a[2]))), 0U;
     }},
    {"flash", [](auto& d, auto& a) { return Same(d.Flash(a[0], a[1])); }},
    {"cells", [](auto& d, auto& a) { return Same(d.Cells(a[0], a[1])); }},
    {"load", [](auto& d, auto& a) { return d.device.LoadProgram(a.text, "d/"), 0U; }},
    {"run", [](auto& d, auto&) { return d.device.Run(), 0U; }},
    {"halt", [](auto& d, auto&) { return d.device.Halt(), 0U; }},
    {"reset", [](auto& d, auto& a) { return d.device.Reset(a[0] != 0), 0U; }},
    {"power-cycle", [](auto& d, auto&) { return d.device.PowerCycle(), 0U; }},
    {"start", [](auto& d, auto&) { return d.StartLoader(), 0U; }},
    {"chunk", [](auto& d, auto& a) { return d.HandOver(a.Int(0), a[1], Bytes(a[2], 0x3C)), 0U; }},
    {"program", [](auto& d, auto& a) { return d.Program(a[0]), 0U; }},
    {"hold", [](auto& d, auto& a) { return d.HoldPeripherals(a[0]), 0U; }},
    {"blocks", [](auto& d, auto& a) { return d.EraseBlocks(a.numbers), 0U; }},
    {"broken", [](auto& d, auto& a) { return d.ExpectBroken(a.text), 0U; }},
};

Arguments ArgumentsOf(const std::string& name, const std::string& text) {
    Arguments arguments{text};
    const int base = name == "pause" || name == "clock" ? 10 : 16;
    if (name == "load" || name == "broken") return arguments;
    std::istringstream words(text);
    for (std::string word; words >> word;) {
        if (word == "=")
            arguments.expected = 0;
        else if (const auto number = std::stoull(word, nullptr, base); arguments.expected)
            arguments.expected = static_cast<std::uint32_t>(number);
        else
            arguments.numbers.push_back(number);
    }
    return arguments;
}

void Take(DebuggedDevice& debugged, const std::string& steps) {
    for (const std::string& step : test::Split(steps, "; ")) {
        const std::string name = step.substr(0, step.find(' '));
        const std::string text = step.substr(std::min(name.size() + 1, step.size()));
        const Arguments arguments = ArgumentsOf(name, text);
        const std::uint32_t found = kSteps.at(name)(debugged, arguments);
        EXPECT_EQ(found, arguments.expected.value_or(found)) << step;
    }
}

TEST(Rules, RefusedAccessNamesTheRule) {
    for (const auto& row : test::ReadTable("target/refused.txt", 2)) {
        DebuggedDevice debugged;
        const std::string error = ErrorOf([&] { Take(debugged, row[1]); });
        EXPECT_TRUE(error.ends_with(row[0])) << error << " instead of " << row[0];
        EXPECT_EQ(debugged.device.Violations(), std::vector{error});
    }
}

TEST(Device, BehavesAsTold) {
    for (const test::Scenario& scenario : test::ReadScenarios("target/behaviour.txt")) {
        SCOPED_TRACE(scenario.name);
        DebuggedDevice debugged(scenario.device);
        for (const std::string& step : scenario.steps)
            Take(debugged, step);
        EXPECT_EQ(debugged.device.Violations(), std::vector<std::string>());
    }
}

TEST(WriteKey, WrongOneDoesNothing) {
    for (const auto& row : test::ReadTable("target/write-keys.txt", 3)) {
        const std::string& options = row[0];
        const auto right = static_cast<std::uint32_t>(std::stoul(row[1], nullptr, 16));
        const auto wrong = static_cast<std::uint32_t>(std::stoul(row[2], nullptr, 16));
        DebuggedDevice debugged(options);
        debugged.device.Flash().Preset(0x4000, Bytes{0});
        for (const std::uint32_t key : {wrong, right}) {
            for (const std::uint32_t command : {2U, 4U, 8U}) {
                debugged.SetWord(kUser0, command);
                debugged.Command(command == 8   ? 0x80000000
                                 : command == 4 ? 0
                                                : 0x4000,
                                 key << 16 | command);
                if (command != 8) debugged.device.Pause(2 * command * 1ms);  // shows by then
                EXPECT_EQ(debugged.Word(kFlashCommand), key == right ? command : 0) << options;
                debugged.device.Pause(100ms);
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
    for (const auto& row : test::ReadTable("target/waits.txt", 5)) {
        for (const bool enough : {false, true}) {
            SCOPED_TRACE(row[0] + row[2] + (enough ? " enough" : " too short"));
            DebuggedDevice debugged(row[1] + ",latency=0,bandwidth=0");
            Take(debugged, row[3]);
            debugged.device.Pause((std::stoul(row[2]) - !enough) * 1ms);
            Take(debugged, row[4]);
            if (!enough) debugged.ExpectBroken(row[0]);
            EXPECT_EQ(debugged.device.Violations(), std::vector<std::string>());
        }
    }
}

// Every bit of every word counts, but for the fields of the divider before that is set.
TEST(Rules, ClockTakesExactWords) {
    for (std::size_t word = 0; word < 3; ++word) {
        for (int bit = 0; bit < 32; ++bit) {
            DebuggedDevice debugged("ravik", false);
            debugged.SetWord(0x400FE140, 7);
            debugged.device.Pause(16ms);
            std::array<std::uint32_t, 3> words = {0x01803FF3, 0x01803F80, 0x07803F82};
            words[word] ^= 1U << bit;
            debugged.SetClock(words);
            debugged.device.Pause(16ms);
            debugged.Command(0, 0xA4420002);
            const bool free = word == 1 && (0x079E0000 >> bit & 1) != 0;
            EXPECT_EQ(debugged.device.Violations().empty(), free) << word << " " << bit;
        }
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
    debugged.device.Pause(1ms);
    EXPECT_EQ(debugged.Flash(0x1000, image.size()), image);
    EXPECT_EQ(debugged.device.LoaderBusyTime(), 6 * 200us);
    EXPECT_TRUE(debugged.device.Violations().empty());
}

TEST(Faults, ComeAsAsked) {
    DebuggedDevice once("tolva,fail-access=3", false);  // the device's halt is the first
    EXPECT_EQ(once.Word(0x400FE000), 0x10010100U);
    EXPECT_EQ(ErrorOf([&] { once.Word(0x400FE000); }),
              "Reading 1 x 4 bytes at 0x400fe000 on page 1: the connection to the target failed at "
              "access 3 [fail-access]");
    EXPECT_EQ(once.Word(0x400FE000), 0x10010100U);

    DebuggedDevice fromThen("tolva,fail-from=2", false);
    for (int i = 0; i < 3; ++i)
        EXPECT_TRUE(ErrorOf([&] { fromThen.device.Run(); }).ends_with("[fail-from]"));
}

TEST(Time, CannotBeWaitedIntoAnOverflow) {
    DebuggedDevice debugged;
    for (int i = 0; i < 5000; ++i)
        debugged.device.Pause(0xFFFFFFFFms);
    debugged.Command(0, 0xA4420002);
    debugged.clock.Advance(1s);
    EXPECT_EQ(debugged.Word(kFlashCommand), 0U);
}

TEST(Options, BadOnesAreNamed) {
    for (const auto& row : test::ReadTable("target/options.txt", 2)) {
        const std::string error =
            ErrorOf([&] { target::SimulatedDevice(target::ParseDeviceOptions(row[0])); });
        EXPECT_NE(error.find(row[1]), std::string::npos) << error;
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
              "dorna,id=0x901a0200,flash=128M,ram=256K,sector=1K,keyconfig=0xffffffef");
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
        device->Pause(4ms);
        device->Write(&command, 1, kFlashCommand, 1, 4);
        device->Pause(12ms);
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
    for (const auto& row : test::ReadTable("target/kept.txt", 2)) {
        const std::string error = ErrorOf([&] { Decode(contents, row[0]); });
        EXPECT_TRUE(error.starts_with(row[1].empty() ? "no error" : row[1])) << error;
    }
}

}  // namespace
