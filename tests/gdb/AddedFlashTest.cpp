// A debugger's load through a probe with flash added, each packet in turn going wrong on one side
// or the other: what the debugger is told is compared with the device.

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>

#include "base/Hex.h"
#include "tests/gdb/Debugger.h"
#include "tests/support/VirtualTime.h"

namespace {

using namespace target;
using namespace target::gdb;
using namespace std::chrono_literals;
using test::Debugger;
using test::Peer;

constexpr std::uint32_t kFlashBytes = 0x10000;
constexpr std::uint32_t kScratch = 0x20000FF0;  // loader buffers, and the blocks behind them

std::string Pattern(std::size_t size, unsigned seed) {
    std::string bytes(size, '\0');
    for (std::size_t i = 0; i < size; ++i)
        bytes[i] = static_cast<char>(i * i + i / 256 + seed);
    return bytes;
}

std::string Write(std::uint32_t address, const std::string& bytes) {
    return fmt::format("vFlashWrite:{:x}:", address) + bytes;
}

/// Zeros, which are neither erased nor written, but for the last sectors.
std::unique_ptr<SimulatedDevice> Device() {
    static test::VirtualClock clock;
    auto device = std::make_unique<SimulatedDevice>(
        ParseDeviceOptions("quen,flash=64K,erase-time=1ms"), &clock);
    device->Flash().Preset(0, std::vector<std::uint8_t>(kFlashBytes - 0x800, 0));
    return device;
}

// Two odd pieces and a gap; a sector that is only erased; RAM written before and in between.
const std::string kRam = Pattern(64, 7);
const std::string kLater = Pattern(16, 9);
const std::string kFirst = Pattern(1500, 1);
const std::string kSecond = Pattern(700, 2);

const std::vector<std::string> kLoad = {
    "qSupported:swbreak+",
    "?",
    "qXfer:memory-map:read::0,fff",
    "Z0,100,2",
    "Hg1",
    "P5=78563412",
    fmt::format("M{:x},{:x}:", kScratch, kRam.size()) + base::ToHex(kRam),
    "vFlashErase:400,800",
    "vFlashErase:1000,400",
    Write(0x403, kFirst),
    fmt::format("M{:x},{:x}:", kScratch + 8, kLater.size()) + base::ToHex(kLater),
    "vFlashErase:c00,400",
    Write(0xBF0, kSecond),
    "m1000,4",
    "vFlashDone",
};

constexpr std::size_t kFirstErase = 7;
constexpr std::size_t kLastRam = 10;

std::string ExpectedFlash() {
    std::string flash(kFlashBytes - 0x800, '\0');
    flash += std::string(0x800, '\xFF');
    flash.replace(0x400, 0xC00, 0xC00, '\xFF').replace(0x1000, 0x400, 0x400, '\xFF');
    return flash.replace(0x403, kFirst.size(), kFirst).replace(0xBF0, kSecond.size(), kSecond);
}

std::string ExpectedRam() {
    std::string ram = kRam;
    return ram.replace(8, kLater.size(), kLater);
}

struct Told {
    std::vector<std::string> answers;  ///< "-" for none
    bool flashRefused = false;
    bool Done() const { return answers.back() == "OK" && !flashRefused; }
};

Told AskAll(Debugger& debugger, const std::vector<std::string>& requests) {
    Told told;
    for (const std::string& request : requests) {
        told.answers.push_back(debugger.Ask(request).value_or("-"));
        told.flashRefused |= request.starts_with("vFlash") && told.answers.back() != "OK";
    }
    return told;
}

/// What the debugger had on the target before the load.
void CheckGivenBack(Peer& peer, const std::string& what) {
    std::string ram(kRam.size(), '\0');
    peer.Device().Halt();
    peer.Device().Read(ram.data(), ram.size(), kScratch, 1, 1);
    EXPECT_EQ(base::ToHex(ram), base::ToHex(ExpectedRam())) << what;
    EXPECT_EQ(peer.Served().Registers().values[5], 0x12345678U) << what;
}

void CheckFlash(Peer& peer, const std::string& what) {
    const auto flash = peer.Device().FlashContents();
    EXPECT_TRUE(std::string(flash.begin(), flash.end()) == ExpectedFlash()) << what;
}

/// Asks for all of it and holds what was told against the device.
Told CheckLoad(Peer& peer, const std::string& fault, const std::vector<std::string>& load,
               Debugger::Way way = Debugger::Way::Plain) {
    Told told;
    const auto start = std::chrono::system_clock::now();
    std::string what = fault;
    testing::internal::CaptureStderr();
    {
        Debugger debugger(peer, way);
        told = AskAll(debugger, load);
        debugger.Leave();
        what += debugger.complaints;
    }
    peer.Log();
    what += testing::internal::GetCapturedStderr();
    EXPECT_LT(std::chrono::system_clock::now() - start, 20s) << fault;
    if (!told.Done()) return told;
    CheckFlash(peer, what);
    // RAM and registers of a debugger whose own requests were not all carried out are its own
    // affair.
    if (std::ranges::count(told.answers, "OK") >= 12) CheckGivenBack(peer, what);
    return told;
}

const std::optional<std::string> kAsItIs;

TEST(AddedFlash, IsLoadedAndNothingElseChanges) {
    const test::Patience patience;
    Peer peer([](const std::string&) { return kAsItIs; }, {}, Device());
    const Told told = CheckLoad(peer, "no fault", kLoad);
    std::string answers;
    for (const std::string& answer : told.answers)
        answers += answer.substr(0, 8) + " ";
    EXPECT_EQ(answers, "PacketSi T05threa l<?xml v OK OK OK OK OK OK OK OK OK OK ffffffff OK ");
    EXPECT_NE(told.answers[0].find(";QStartNoAckMode+;qXfer:memory-map:read+"), std::string::npos);
    EXPECT_NE(told.answers[2].find("\"flash\" start=\"0x0\" length=\"0x10000\"><property "
                                   "name=\"blocksize\">0x400"),
              std::string::npos);
}

// As an emulator whose target ran does it.
TEST(AddedFlash, KeepsAStopThatNobodyAskedForToItself) {
    const test::Patience patience;
    Peer peer(
        [](const std::string& payload) -> std::optional<std::string> {
            if (!payload.starts_with("qSupported")) return std::nullopt;
            return "+" + Framed("T02thread:1;") + Framed("PacketSize=400");
        },
        {}, Device());
    Debugger debugger(peer);
    const Told told = AskAll(debugger, {"qSupported", "?", "mf800,2"});
    EXPECT_EQ(fmt::format("{}", fmt::join(told.answers, " ")),
              "PacketSize=400;QStartNoAckMode+;qXfer:memory-map:read+ T05thread:1; ffff");
}

// Each line: requests of a session of its own, and the answers. Nothing is touched by what is
// refused.
TEST(AddedFlash, RefusesWhatItCanNotDo) {
    const test::Patience patience;
    const struct {
        std::vector<std::string> requests;
        const char* answers;
    } rows[] = {
        {{"vFlashWrite:400:a", "vFlashDone"}, "E01 OK "},
        {{"vFlashErase:10,400", "vFlashErase:10000,400", "vFlashErase:0,ffff0000"}, "E01 E01 E01 "},
        {{"vFlashErase:zz", "vFlashWrite:ffff:ab", "vFlashDonex"}, "E01 E01 E01 "},
        {{"vFlashErase:fc00,800"}, "E01 "},
        {{"vFlashErase:400,400", "vFlashWrite:500:ab", "vFlashWrite:500:ab", "vFlashWrite:501:x"},
         "OK OK OK E01 "},
        {{"vFlashErase:400,400", "vFlashWrite:400:ab", "m3fe,5", "M400,1:00", "x400,1"},
         "OK OK 00006162ff E01  "},
        {{"QNonStop:1", "vCont;c", "vFlashErase:400,400"}, " - E01 "},
        {{Write(0xF900, "blank"), "vFlashDone", "mf900,5", Write(0xF900, "blanc")},
         "OK OK 626c616e6b E01 "},
    };
    for (const auto& row : rows) {
        Peer peer([](const std::string&) { return kAsItIs; }, {}, Device());
        std::string answers;
        std::string complaints;
        {
            Debugger debugger(peer);
            AskAll(debugger, {"qSupported", "?"});
            for (const std::string& answer : AskAll(debugger, row.requests).answers)
                answers += answer + " ";
            debugger.Leave();
            complaints = debugger.complaints;
        }
        EXPECT_EQ(answers, row.answers) << row.requests[0] << complaints;
        const auto held = peer.Device().FlashContents();
        if (row.requests.back() == Write(0xF900, "blanc")) continue;
        EXPECT_TRUE(std::all_of(held.begin(), held.end() - 0x800, [](auto b) { return b == 0; }));
    }
}

// The debugger's requests, each left out, or sent twice.
TEST(AddedFlash, TellsTheTruthWhateverTheDebuggerSends) {
    const test::Patience patience;
    for (std::size_t at = 0; at + 1 < kLoad.size(); ++at) {
        std::vector<std::string> twice = kLoad;
        twice.insert(twice.begin() + static_cast<std::ptrdiff_t>(at), kLoad[at]);
        Peer peer([](const std::string&) { return kAsItIs; }, {}, Device());
        EXPECT_TRUE(CheckLoad(peer, "twice: " + kLoad[at].substr(0, 20), twice).Done());
        if (!kLoad[at].starts_with("vFlash")) continue;
        std::vector<std::string> without = kLoad;
        without.erase(without.begin() + static_cast<std::ptrdiff_t>(at));
        Peer other([](const std::string&) { return kAsItIs; }, {}, Device());
        Debugger debugger(other);
        const bool refused = std::ranges::count(AskAll(debugger, without).answers, "E01") > 0;
        const bool erase =
            kLoad[at].starts_with("vFlashErase") && kLoad[at] != "vFlashErase:1000,400";
        EXPECT_EQ(refused, erase) << kLoad[at].substr(0, 20);
    }
}

// Damaged on the way and sent again; arrived in pieces; the answer damaged, and asked for again.
TEST(AddedFlash, TakesPacketsThatComeThroughBadly) {
    const test::Patience patience;
    using Way = Debugger::Way;
    for (const Way way : {Way::Damaged, Way::Late, Way::Refused}) {
        Peer peer([](const std::string&) { return kAsItIs; }, {}, Device());
        EXPECT_TRUE(CheckLoad(peer, "", kLoad, way).Done()) << static_cast<int>(way);
        const auto erases = std::ranges::count(peer.Log(), "z0,100,2");
        EXPECT_EQ(erases, 1) << "a load was done twice";
    }
}

// As the debugger's Ctrl-C, or its end, comes with one of the packets to the probe.
TEST(AddedFlash, CanBeInterruptedAndLeft) {
    const test::Patience patience;
    std::size_t packets = 0;
    for (const bool hangsUp : {false, true}) {
        int failed = 0;
        for (std::size_t at = 0; at == 0 || at < packets; at += 3) {
            std::size_t index = 0;
            std::atomic<Debugger*> debugger = nullptr;
            std::atomic<bool> later = false;
            Peer peer(
                [&](const std::string&) -> std::optional<std::string> {
                    if (index++ == at && debugger && !later)
                        hangsUp ? debugger.load()->HangUp() : debugger.load()->Interrupt();
                    return std::nullopt;
                },
                {}, Device());
            Debugger own(peer);
            debugger = &own;
            const Told first = AskAll(own, kLoad);
            packets = std::max(packets, index);
            later = true;
            const std::string what =
                fmt::format("{} {}: {}", hangsUp, at, fmt::join(first.answers, "|"));
            if (first.Done()) CheckFlash(peer, what);
            if (!first.Done()) ++failed;
            if (!hangsUp) {
                EXPECT_TRUE(AskAll(own, kLoad).Done()) << what << own.complaints;
                CheckFlash(peer, what + own.complaints);
            }
            own.Leave();
            const bool begun = first.answers[kFirstErase] == "OK";
            if (begun && own.complaints.empty()) CheckFlash(peer, what);
            peer.Log();
            if (!hangsUp || first.answers[kLastRam] == "OK")
                CheckGivenBack(peer, what + own.complaints);
            if (HasFailure()) return;
        }
        EXPECT_GT(failed, 15);
    }
}

// A chunk, an erase or a loader that went nowhere, although the probe said OK.
TEST(AddedFlash, ComparesWhatItSaysIsDone) {
    for (const char* lost : {"X20000000", "X20001004", "M400fd008", "X20002000"}) {
        Peer peer(
            [&](const std::string& payload) -> std::optional<std::string> {
                if (!payload.starts_with(lost)) return std::nullopt;
                return Framed("OK");
            },
            {}, Device());
        const Told told = CheckLoad(peer, lost, kLoad);
        const auto log = peer.Log();
        EXPECT_TRUE(std::ranges::any_of(log, [&](auto& line) { return line.starts_with(lost); }));
        EXPECT_EQ(told.answers.back(), "E01") << lost;
    }
}

TEST(AddedFlash, TellsTheTruthWhateverTheProbeAnswers) {
    std::size_t packets = 0;
    for (const test::ReplyFault& fault : test::kReplyFaults)
        for (std::size_t failing = 0; failing == 0 || failing < packets; ++failing) {
            test::OneFault one(fault, failing);
            Peer peer(one.Instead(), one.Bend(), Device());
            CheckLoad(peer, fmt::format("{} {}", failing, fault.name), kLoad);
            packets = std::max(packets, one.Packets());
            if (HasFailure()) FAIL() << one.Asked();
        }
    EXPECT_GT(packets, 100U);
}

}  // namespace
