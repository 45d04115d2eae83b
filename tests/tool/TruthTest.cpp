// What the tool says about a device is compared with what the device holds: for every command that
// changes it, with each access failing in turn, once and from then on, with the simulated device's
// other faults, and behind a GDB server that misbehaves at any packet.

#include <fmt/format.h>
#include <gtest/gtest.h>
#include <stdlib.h>
#include <sys/wait.h>

#include <algorithm>
#include <array>
#include <filesystem>
#include <fstream>
#include <map>
#include <nlohmann/json.hpp>
#include <stdexcept>

#include "base/Crc32.h"
#include "host/Tool.h"
#include "host/targets/SimulatedTarget.h"
#include "target/simulated/Contents.h"
#include "tests/gdb/Peer.h"
#include "tests/support/TemporaryDirectory.h"
#include "tests/support/VirtualTime.h"

namespace host {
namespace {

namespace fs = std::filesystem;
using nlohmann::json;
using Words = std::vector<std::string>;

constexpr std::uint32_t kFlashBytes = 0x4000;
constexpr std::uint32_t kSectorBytes = 0x400;
constexpr std::uint32_t kImageAddress = 0x400;
constexpr std::uint32_t kImageBytes = 4700;  // three chunks
constexpr char kDevice[] = "quen,flash=16K";

/// A command with what it may touch and what it leaves when it's done. The flash holds zeros
/// before, which are neither erased nor in the image.
struct Work {
    Words words;
    std::uint32_t first = 0;  ///< the sectors that it erases
    std::uint32_t end = 0;
    bool programs = false;
    std::array<std::uint32_t, 2> committed = {0xABC, 0xDEF};
};

const Work kWorks[] = {
    {{"program", "new.bin", "--base", "400"}, 0x400, 0x1800, true},
    {{"program", "new.bin", "--base", "400", "--erase", "all", "--blank-check", "--crc"},
     0,
     kFlashBytes,
     true},
    {{"program", "new.bin", "--base", "400", "--no-verify"}, 0x400, 0x1800, true},
    {{"erase", "--range", "400-bff"}, 0x400, 0xC00},
    {{"erase", "--all", "--no-verify"}, 0, kFlashBytes},
    {{"operation", "Erase", "--set", "FlashEraseType=Entire Flash"}, 0, kFlashBytes},
    {{"register", "program", "1", "12ab", "--commit"}, 0, 0, false, {0xABC, 0x12AB}},
    {{"mac", "program", "02-1b-c3-04-05-06", "--commit"}, 0, 0, false, {0xC31B02, 0x060504}},
    {{"mac", "program", "02-1b-c3-04-05-06"}},
    {{"operation", "ProgramUserRegister0", "--set", "FlashUserRegister0Input=77", "--set",
      "FlashUserRegister0Commit=1"},
     0,
     0,
     false,
     {0x77, 0xDEF}},
};

struct Contents {
    std::vector<std::uint8_t> flash = std::vector<std::uint8_t>(kFlashBytes);
    std::array<std::uint32_t, 2> committed{};  ///< the user registers after a power cycle
};

/// What one run said.
struct Said {
    int status = 0;
    json end;
    std::string text;                      ///< what people read
    std::array<std::uint32_t, 2> written;  ///< what the user registers hold until power goes
};

/// Another build of the tool than the one in here, in a process of its own and with its own
/// plug-in.
const char* const kTriedTool = getenv("CORVANE_TRIED_TOOL");

struct Answer {
    int status;
    std::string out;
    std::string err;
};

Answer RunHere(Words words) {
    words.insert(words.end(), {"--plugin", FLASH_CORVANE_LIBRARY});
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    const int status = RunTool(words);
    return {status, testing::internal::GetCapturedStdout(), testing::internal::GetCapturedStderr()};
}

Answer RunTried(const Words& words) {
    const int status = std::system(
        fmt::format("'{}' '{}' >out 2>err", kTriedTool, fmt::join(words, "' '")).c_str());
    return {WEXITSTATUS(status), test::Contents("out"), test::Contents("err")};
}

class ToolRuns {
  public:
    ToolRuns() {
        fs::current_path(directory_.Path());
        setenv("XDG_CONFIG_HOME", directory_.Path().c_str(), 1);
        for (std::uint32_t i = 0; i < kImageBytes; ++i)
            image_ += static_cast<char>(1 + i % 251);
        std::ofstream("new.bin").write(image_.data(), kImageBytes);
        std::ofstream("old.bin") << std::string(kFlashBytes, '\0');
        Run({"program", "old.bin", "--base", "0"}, "");
        Run({"register", "program", "0", "abc", "--commit"}, "");
        Run({"register", "program", "1", "def", "--commit"}, "");
        device_ = test::Contents("device");
    }
    ~ToolRuns() { fs::current_path("/"); }

    void PutBack() const { std::ofstream("device", std::ios::binary) << device_; }

    static Said Run(const Words& words, const std::string& fault) {
        return Run(words, Words{"--sim", kDevice + fault, "--sim-file", "device"});
    }

    static Said Run(Words words, const Words& target) {
        fs::remove("trace");
        words.insert(words.end(), target.begin(), target.end());
        words.insert(words.end(), {"--json", "--trace", "trace", "--set", "FlashTimeoutValue=2"});
        const Answer answer = kTriedTool == nullptr ? RunHere(words) : RunTried(words);
        Said said{answer.status, {}, answer.err, {0xABC, 0xDEF}};
        const std::string& lines = answer.out;
        if (lines.empty())
            throw std::runtime_error(
                fmt::format("nothing but {} and '{}'", answer.status, answer.err));
        said.end = json::parse(lines.substr(lines.rfind('\n', lines.size() - 2) + 1));
        std::ifstream trace("trace");
        for (std::string line; std::getline(trace, line);)
            for (const std::size_t index : {0U, 1U})
                if (const auto at = line.find(fmt::format("WriteMemory 0x400fe1e{}", 4 * index));
                    at != std::string::npos && line.find("-> error") == std::string::npos)
                    said.written.at(index) = static_cast<std::uint32_t>(
                        std::stoul(line.substr(line.find("= 0x", at) + 2), nullptr, 16));
        return said;
    }

    /// The device as it is without the tool; a cell that is stuck stays so.
    static Contents ReadDevice(const std::string& fault) {
        TargetOptions options;
        options.sim = kDevice + (fault.starts_with(",stuck") ? fault : "");
        options.simFile = "device";
        SimulatedTarget opened(options, [](const std::string&) {});
        target::Target& device = opened.Get();
        Contents contents;
        device.Halt();
        device.Read(contents.flash.data(), kFlashBytes, 0, 0, 1);
        for (const std::uint32_t index : {0U, 1U})
            device.Read(&contents.committed.at(index), 1, 0x400FE1E0 + 4 * index, 1, 4);
        return contents;
    }

    /// The device, to be put behind a server.
    std::unique_ptr<target::SimulatedDevice> Device() const {
        return target::DecodeContents(device_, target::ParseDeviceOptions(kDevice));
    }

    /// Whether flash holds the first bytes of the image.
    bool HoldsImage(const Contents& now, std::uint64_t bytes = kImageBytes) const {
        const auto* image = reinterpret_cast<const std::uint8_t*>(image_.data());
        return std::equal(image, image + std::min<std::uint64_t>(bytes, kImageBytes),
                          now.flash.begin() + kImageAddress);
    }

    std::vector<std::string> FalseClaims(const Work& work, const Said& said,
                                         const Contents& now) const;

  private:
    test::TemporaryDirectory directory_;
    std::string image_;
    std::string device_;
};

std::uint64_t Bytes(const json& result, const char* phase) {
    return result.value("/phases"_json_pointer / phase / "bytes", std::uint64_t{0});
}

/// Every sentence, status and member that isn't true.
std::vector<std::string> ToolRuns::FalseClaims(const Work& work, const Said& said,
                                               const Contents& now) const {
    std::vector<std::string> untrue;
    const auto claim = [&](bool made, bool isTrue, const char* what) {
        if (made && !isTrue) untrue.emplace_back(what);
    };
    const auto says = [&](const char* part) { return said.text.find(part) != std::string::npos; };
    const json& result = said.end["result"];
    const auto holds = [&](std::uint32_t first, std::uint32_t end, std::uint8_t byte) {
        return std::all_of(now.flash.begin() + first, now.flash.begin() + end,
                           [=](std::uint8_t found) { return found == byte; });
    };
    const bool flashSame = holds(0, kFlashBytes, 0);
    const bool erased = holds(work.first, work.end, 0xFF);
    std::uint64_t newSectors = 0;
    for (std::uint32_t at = work.first; at < work.end; at += kSectorBytes)
        newSectors +=
            std::count(now.flash.begin() + at, now.flash.begin() + at + kSectorBytes, 0) == 0;

    claim(true, holds(0, work.first, 0) && holds(work.end, kFlashBytes, 0), "left the rest alone");
    claim(said.status == 0 && work.programs, HoldsImage(now), "done: programmed");
    claim(said.status == 0 && !work.programs, erased, "done: erased");
    claim(said.status == 0, now.committed == work.committed, "done: committed");
    claim(said.status >= 2 && said.status <= 4, flashSame, "not begun");
    claim(says("the flash is as it was"), flashSame, "the flash is as it was");
    const bool flashUnknown = says("what the flash holds isn't known");
    claim(!result.value("flashChanged", true), flashSame, "flashChanged");
    claim(said.status == 5, work.programs ? !HoldsImage(now) : work.first == work.end || !erased,
          "differs");
    claim(says("the image is programmed") || says("the flash holds the image"), HoldsImage(now),
          "the image is programmed");
    claim(says("are erased, but") || says("is blank") || result.value("blank", false), erased,
          "erased");
    claim(said.status != 5, newSectors * kSectorBytes >= Bytes(result, "erase"), "bytes erased");
    claim(said.status != 5 && Bytes(result, "program") > 0,
          HoldsImage(now, Bytes(result, "program")), "bytes written");
    claim(said.status == 1 && !flashSame,
          says("the flash is incomplete") || says("the image is programmed") ||
              says("are erased, but") || flashUnknown,
          "the state of the flash is told");

    for (const std::size_t index : {0U, 1U}) {
        const bool changed =
            now.committed.at(index) != Contents{{}, {0xABC, 0xDEF}}.committed.at(index);
        claim(says("registers are as they were") || !result.contains("registers"), !changed,
              "the registers are as they were");
        if (!result.contains("registers")) continue;
        const json& entry = result["registers"][index];
        claim(!entry["value"].is_null(), entry["value"] == said.written.at(index), "value");
        claim(entry["committed"] == true, now.committed.at(index) == said.written.at(index),
              "committed");
        claim(entry["committed"] == false, !changed, "not committed");
        claim(says("registers are as they were"),
              said.written.at(index) == (index == 0 ? 0xABC : 0xDEF), "not written");
    }

    claim(true, said.end["status"] == said.status && said.end["ok"] == (said.status == 0),
          "the same status");
    if (said.status == 0) return untrue;
    const std::string error = said.end["error"];
    for (const char* part :
         {"the flash is as it was", "isn't known", "registers are as they were", "incomplete",
          "the image is programmed", "are erased, but", "couldn't be halted", "(committed)",
          "(perhaps committed)", "(not committed)"})
        claim(true, says(part) == (error.find(part) != std::string::npos), part);
    return untrue;
}

void Check(const ToolRuns& runs, const Work& work, const std::string& fault, const Said& said,
           const Contents& now) {
    for (const std::string& text : runs.FalseClaims(work, said, now))
        ADD_FAILURE() << "not true: " << text << "\nwith " << fault << ": "
                      << fmt::format("{}", fmt::join(work.words, " ")) << '\n'
                      << said.text << said.end;
}

Said CheckWith(const ToolRuns& runs, const Work& work, const std::string& fault) {
    runs.PutBack();
    Said said = runs.Run(work.words, fault);
    Check(runs, work, std::string("--sim ") + kDevice + fault, said, ToolRuns::ReadDevice(fault));
    return said;
}

TEST(Truth, HoldsWhateverAccessFails) {
    const int step = kTriedTool == nullptr ? 1 : 23;  // a process takes longer
    const ToolRuns runs;
    for (const Work& work : kWorks)
        for (const char* fault : {"fail-access", "fail-from"}) {
            // A fault that is swallowed doesn't end the sweep; one that comes too late does.
            int done = 0;
            for (int access = 1; done < 3 && !testing::Test::HasFailure(); access += step) {
                const Said said = CheckWith(runs, work, fmt::format(",{}={}", fault, access));
                done = said.status == 0 ? done + 1 : 0;
                EXPECT_TRUE(said.status == 0 || access > 6 || said.status == 4);
            }
        }
}

TEST(Truth, HoldsOfFaultyDevices) {
    const ToolRuns runs;
    for (const Work& work : kWorks)
        for (const char* fault : {"", ",stuck-cell=0x500", ",erase=never", ",loader=hangs",
                                  ",loader=dead", ",commit=never"}) {
            // What isn't read back isn't known.
            const bool compares = work.words.back() != "--no-verify";
            if (!compares && std::string(fault).starts_with(",stuck")) continue;
            CheckWith(runs, work, fault);
        }
}

TEST(Truth, HoldsHoweverSlowTheLoader) {
    const ToolRuns runs;
    for (const char* chunkTime : {"0", "1ms", "60ms", "100ms", "500ms", "1500ms"}) {
        const Said said = CheckWith(runs, kWorks[0], fmt::format(",chunk-time={}", chunkTime));
        EXPECT_EQ(said.status, 0) << chunkTime << said.text;
        EXPECT_EQ(Bytes(said.end["result"], "program"), (kImageBytes + 127) / 128 * 128);
    }
    for (const std::size_t bytes : {100U, 5000U}) {
        std::ofstream("hangs.bin") << std::string(bytes, 'x');
        const auto before = test::VirtualNow();
        const Said said = ToolRuns::Run({"program", "hangs.bin", "--base", "0"}, ",loader=hangs");
        EXPECT_NE(said.text.find(bytes == 100 ? "within 2 s" : "timed out"), std::string::npos)
            << said.text;
        EXPECT_LE(test::VirtualNow() - before, std::chrono::seconds(60)) << bytes;
    }
}

TEST(Truth, HoldsOfWhatIsLeftAlone) {
    const ToolRuns runs;
    std::string image(12 * 1024 - 100, 'x');
    // How many bytes were looked at, erased and written.
    const auto load = [&](const Words& words = {"program", "image.bin", "--base", "0"}) {
        std::ofstream("image.bin") << image;
        const Said said = ToolRuns::Run(words, "");
        EXPECT_EQ(said.status, 0) << said.text;
        const Contents now = ToolRuns::ReadDevice("");
        EXPECT_EQ(std::string(now.flash.begin(), now.flash.begin() + std::ssize(image)), image);
        const json& result = said.end["result"];
        EXPECT_EQ(Bytes(result, "verify"), image.size());
        return fmt::format("{:x} {:x} {:x}", Bytes(result, "look"), Bytes(result, "erase"),
                           Bytes(result, "program"));
    };
    EXPECT_EQ(load(), "0 3000 3000");  // the samples tell that nothing is there
    EXPECT_EQ(load(), "3000 0 0");
    EXPECT_EQ(test::Contents("trace").find("LoadProgram"), std::string::npos);
    image[0x7FF] = 'y';
    EXPECT_EQ(load(), "3000 400 400");
    image[0x800] = image[0x1000] = image[0x2C00] = 'z';  // one sector between, then six
    EXPECT_EQ(load(), "3000 1000 1000");
    EXPECT_EQ(load({"program", "image.bin", "--base", "0", "--rewrite"}), "0 3000 3000");
    image.assign(kFlashBytes, 'w');
    EXPECT_EQ(load(), "0 4000 4000");  // all at once
    EXPECT_NE(test::Contents("trace").find("0xa4420004"), std::string::npos);
    image[0] = 'v';
    EXPECT_EQ(load(), "4000 400 400");
}

/// One run with the device behind this server. Gives the number of packets that the server saw.
std::size_t CheckBehind(const ToolRuns& runs, const Work& work, const std::string& fault,
                        test::Peer& peer, Said& said, const char* options = "timeout=1s") {
    const auto start = std::chrono::system_clock::now();
    said = ToolRuns::Run(work.words, Words{"--gdb", peer.Where().Text(), "--loader",
                                           test::LoaderFile(), "--gdb-option", options});
    const std::size_t packets = peer.Log().size();
    EXPECT_LT(std::chrono::system_clock::now() - start, std::chrono::seconds(20)) << fault;
    const target::SimulatedDevice& device = peer.Device();
    for (const std::uint32_t index : {0U, 1U})
        said.written.at(index) = device.PeekRegister(0x400FE1E0 + 4 * index);
    const Contents now{device.FlashContents(), device.CommittedUserRegisters()};
    Check(runs, work, "a server: " + fault, said, now);
    return packets;
}

TEST(Truth, HoldsBehindAServerThatFailsAtAnyPacket) {
    const ToolRuns runs;
    for (const Work& work : {kWorks[0], kWorks[3], kWorks[7]}) {
        Said said;
        test::Peer sound([](const std::string&) { return std::nullopt; }, {}, runs.Device());
        const std::size_t packets = CheckBehind(runs, work, "no fault", sound, said, "timeout=60s");
        EXPECT_EQ(said.status, 0) << said.text;
        for (const test::ReplyFault& fault : test::kReplyFaults)
            for (std::size_t failing = 0; failing < packets; ++failing) {
                test::OneFault one(fault, failing);
                test::Peer peer(one.Instead(), one.Bend(), runs.Device());
                CheckBehind(runs, work, fmt::format("reply {} {}", failing, fault.name), peer,
                            said);
                if (HasFailure()) FAIL() << one.Asked();
            }
    }
}

/// A server that goes wrong in a way of its own.
struct LyingServer {
    const char* name;
    test::Peer::Hook instead;
    test::Peer::Bend bend;
};

const std::string kOk = test::Framed("OK");

struct Range {
    std::uint32_t first = 0;
    std::uint32_t bytes = 0;
};

/// Of "mADDRESS,LENGTH" and what writes memory, for one of these letters.
std::optional<Range> RangeOf(const std::string& payload, const std::string& letters) {
    Range range;
    if (letters.find(payload[0]) == std::string::npos ||
        std::sscanf(payload.c_str() + 1, "%x,%x", &range.first, &range.bytes) != 2)
        return std::nullopt;
    return range;
}

/// What a server says that has lost the target and hides it.
std::optional<std::string> AsIfDone(const std::string& payload) {
    if (const auto read = RangeOf(payload, "m"))
        return test::Framed(std::string(2 * std::size_t{read->bytes}, '0'));
    if (payload == "c" || payload.starts_with("vCont;c")) return "";
    return payload == "\x03" ? test::Framed("T02") : kOk;
}

void HideFailedRead(const std::string& payload, std::string& wire) {
    if (RangeOf(payload, "m") && wire.find("$E") != std::string::npos) wire = *AsIfDone(payload);
}

/// Less than was asked for, which the protocol allows.
void CutRead(const std::string& payload, std::string& wire) {
    const auto read = RangeOf(payload, "m");
    if (!read || read->bytes < 2 || wire.size() < 2 * std::size_t{read->bytes}) return;
    wire = test::Framed(wire.substr(wire.find('$') + 1, read->bytes & ~1U));
}

/// Flash is asked for once, and told as it was then until the target has run.
test::Peer::Bend CachedReads() {
    return [cache = std::map<std::string, std::string>()](const std::string& payload,
                                                          std::string& wire) mutable {
        const auto read = RangeOf(payload, "m");
        if (payload == "c" || payload.starts_with("vCont;c")) cache.clear();
        if (read && read->first < kFlashBytes)
            wire = cache.try_emplace(payload, wire).first->second;
    };
}

/// A write that goes wrong is told as the answer to the next one.
test::Peer::Hook LateWrites() {
    return [](const std::string& payload) -> std::optional<std::string> {
        const auto write = RangeOf(payload, "X");
        return write && write->bytes >= 8 ? std::optional(kOk) : std::nullopt;
    };
}

std::string NewImageChecksum() {
    return fmt::format("{:x}", base::AddToCrc32(base::kCrc32Begin, test::Contents("new.bin")));
}

std::vector<LyingServer> LyingServers() {
    const auto none = [](const std::string&) { return std::nullopt; };
    const auto dropWrites = [](std::uint32_t first, std::uint32_t end) {
        return [=](const std::string& payload) {
            const auto range = RangeOf(payload, "MX");
            const bool drops = range && range->bytes != 0 && range->first - first < end - first;
            return drops ? std::optional(kOk) : std::nullopt;
        };
    };
    const auto says = [](const std::map<std::string, std::string>& answers) {
        return [=](const std::string& payload) -> std::optional<std::string> {
            for (const auto& [request, wire] : answers)
                if (payload.starts_with(request)) return wire;
            return std::nullopt;
        };
    };
    std::string signs;
    for (int i = 0; i < 5000; ++i)
        signs += test::Framed("O");
    const auto before = [](const char* request, const std::string& wire) {
        return [=](const std::string& payload, std::string& reply) {
            if (payload.starts_with(request)) reply.insert(0, wire);
        };
    };
    return {
        {"OK for a chunk that isn't written", dropWrites(0x20000000, 0x20001000), {}},
        {"OK for an order that isn't given", dropWrites(0x20001000, 0x20001020), {}},
        {"OK for a loader that isn't written", dropWrites(0x20002000, 0x20003000), {}},
        {"OK for flash commands that go nowhere", dropWrites(0x400FD000, 0x400FD010), {}},
        {"an old stop told as the program starts", none, before("c", test::Framed("T05"))},
        {"the same by vCont", none, before("vCont;c", test::Framed("T05"))},
        {"each stop told twice", none, before("\x03", test::Framed("T02"))},
        {"a notification of an old stop", none, before("vCont?", "%Stop:T05#99")},
        {"garbage before a monitor command's OK", none, before("qRcmd", test::Framed("garbage"))},
        {"a stopped target that runs and can't be halted",
         says({{"?", test::Framed("T05")}, {"\x03", ""}, {"qRcmd", kOk}}),
         {}},
        {"a reset that only says so", says({{"qRcmd", kOk}}), {}},
        {"signs of life without end", says({{"qRcmd", signs}}), {}},
        {"zeros for failed reads", none, HideFailedRead},
        {"half of each answer to a read", none, CutRead},
        {"flash read once until the target runs", none, CachedReads()},
        {"binary writes answered first and made later", LateWrites(), {}},
        {"the image's checksum for chunks that aren't written", dropWrites(0x20000000, 0x20001000),
         [](const std::string& payload, std::string& wire) {
             if (payload.starts_with("qCRC:")) wire = test::Framed("C" + NewImageChecksum());
         }},
    };
}

TEST(Truth, HoldsBehindServersThatLie) {
    const ToolRuns runs;
    for (const Work& work : {kWorks[0], kWorks[3], kWorks[7]})
        for (const LyingServer& server : LyingServers()) {
            // What is committed can't be read back until the next power cycle.
            if (work.words[0] == "mac" && std::string(server.name).starts_with("OK for flash"))
                continue;
            test::Peer peer(server.instead, server.bend, runs.Device());
            Said said;
            CheckBehind(runs, work, server.name, peer, said);
        }
}

/// A server that loses the target at a packet, and hides it as well as it can.
struct LosesTarget {
    std::size_t packetsLeft;

    std::optional<std::string> operator()(const std::string& payload) {
        if (packetsLeft == 0) return AsIfDone(payload);
        --packetsLeft;
        return std::nullopt;
    }
};

constexpr char kTrusted[] = "reads=trusted,live=no,timeout=10s";

TEST(Truth, HoldsWhereTheCableComesOffAndTheServerHidesIt) {
    const ToolRuns runs;
    for (const Work& work : {kWorks[0], kWorks[2], kWorks[3], kWorks[7], kWorks[9]}) {
        Said said;
        std::size_t packets = 9;
        for (std::size_t lost = 8; lost < packets + 3 && !HasFailure(); lost += 3) {
            test::Peer peer(LosesTarget{lost}, {}, runs.Device());
            packets = CheckBehind(runs, work, fmt::format("the cable off at {}", lost), peer, said,
                                  kTrusted);
        }
        EXPECT_EQ(said.status, 0) << said.text;
    }
}

// What a command has read is told, or that the device is lost; never what was made of a lost one.
TEST(Truth, HoldsOfWhatIsReadAsTheCableComesOff) {
    const ToolRuns runs;
    ToolRuns::Run({"program", "new.bin", "--base", "400"}, "");
    const std::string contents = test::Contents("device");
    const Words commands[] = {
        {"read", "out.bin", "--range", "400-17ff"},
        {"verify", "new.bin", "--base", "400"},
        {"blank-check", "--range", "400-1fff"},
        {"checksum"},
        {"mac", "read"},
        {"register", "read", "0"},
        {"operation", "ReadMACAddress"},
        {"operation", "CalculateChecksum"},
        {"map"},
        {"program", "new.bin", "--base", "400"},
    };
    for (const Words& command : commands) {
        json whole;
        std::size_t packets = 1;
        const auto behind = [&](std::size_t lost) {
            fs::remove("out.bin");
            test::Peer peer(LosesTarget{lost}, {},
                            target::DecodeContents(contents, target::ParseDeviceOptions(kDevice)));
            Said said = ToolRuns::Run(command, {"--gdb", peer.Where().Text(), "--gdb-option",
                                                kTrusted, "--loader", test::LoaderFile()});
            packets = peer.Log().size();
            said.end.erase("seconds");
            said.end["result"].erase("phases");
            return said;
        };
        whole = behind(100'000).end;
        EXPECT_EQ(whole["status"], command[0] == "blank-check" ? 5 : 0);
        for (std::size_t lost = 8; lost < packets && !HasFailure(); lost += 3) {
            const Said said = behind(lost);
            if (said.end == whole) continue;
            EXPECT_EQ(said.status, 4) << lost << ' ' << said.text << said.end;
            EXPECT_FALSE(fs::exists("out.bin")) << lost;
            for (const char* told : {" value: ", "holds 0x", "differ"})
                EXPECT_EQ(said.text.find(told), std::string::npos) << lost << ' ' << said.text;
        }
    }
}

// Whichever request of a check fails, the RAM is as it was, or told not to be.
TEST(Truth, HoldsOfTheRamThatACheckWrites) {
    const ToolRuns runs;
    std::vector<std::uint8_t> before(0x3000);
    for (std::size_t i = 0; i < before.size(); ++i)
        before[i] = static_cast<std::uint8_t>(3 * i + i / 256);
    std::size_t packets = 9;
    Said said;
    for (std::size_t failing = 8; failing < packets + 29; failing += 29) {
        std::size_t index = 0;
        test::Peer peer(
            [&](const std::string&) -> std::optional<std::string> {
                if (index++ != failing) return std::nullopt;
                return "+$E01#a6";
            },
            {}, runs.Device());
        peer.Device().Write(before.data(), before.size(), 0x20000000, 1, 1);
        said = ToolRuns::Run({"check"}, {"--gdb", peer.Where().Text(), "--loader",
                                         test::LoaderFile(), "--gdb-option", "timeout=60s"});
        packets = peer.Log().size();
        auto after = before;
        peer.Device().Read(after.data(), after.size(), 0x20000000, 1, 1);
        const bool told = said.text.find("FAIL  put back") != std::string::npos;
        EXPECT_TRUE(told || after == before) << failing << '\n' << said.text;
        EXPECT_EQ(said.status == 4, said.text.find("FAIL") != std::string::npos) << said.text;
        EXPECT_EQ(peer.Device().FlashContents(), std::vector<std::uint8_t>(kFlashBytes));
    }
    EXPECT_EQ(said.status, 0) << said.text;
    const auto losesTargetAt = [&](std::size_t lost) {
        test::Peer peer(LosesTarget{lost}, {}, runs.Device());
        said = ToolRuns::Run({"check"}, {"--gdb", peer.Where().Text(), "--loader",
                                         test::LoaderFile(), "--gdb-option", kTrusted});
        return peer.Log().size();
    };
    packets = losesTargetAt(100'000);
    EXPECT_EQ(said.status, 0) << said.text;
    for (std::size_t lost = 8; lost < packets; lost += 41) {
        losesTargetAt(lost);
        EXPECT_EQ(said.status, 4) << lost << '\n' << said.text;
    }
}

}  // namespace
}  // namespace host
