// The GDB remote protocol: frames as they stand on the wire, the client beside a peer that follows
// a script and misbehaves where the script says so, and client and server over a real connection.

#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <fstream>
#include <functional>
#include <random>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "base/Crc32.h"
#include "base/Hex.h"
#include "target/gdb/client/GdbTarget.h"
#include "target/gdb/client/RegisterNumbers.h"
#include "target/gdb/server/Server.h"
#include "target/gdb/wire/Frame.h"
#include "tests/gdb/Peer.h"

namespace {

using namespace target;
using namespace target::gdb;
using test::LoaderFile;
using test::Peer;
using namespace std::chrono_literals;

constexpr Mailbox kMailbox{0x20001000, 32, 0xFFFFFFFF};

std::string FramesIn(FrameDecoder& decoder) {
    static constexpr const char* kNames[] = {"packet", "note", "ack", "nak", "interrupt", "damage"};
    std::string text;
    while (const auto frame = decoder.Next())
        text += std::string(kNames[static_cast<int>(frame->kind)]) + "(" + frame->payload + ")";
    return text;
}

TEST(GdbFrames, AreReadAsTheyStandOnTheWire) {
    using Sender = FrameDecoder::Sender;
    const struct {
        Sender sender;
        const char* wire;
        const char* frames;
    } rows[] = {
        {Sender::Server, "$OK#9a", "packet(OK)"},
        {Sender::Server, "$#00", "packet()"},
        {Sender::Server, "$OK#9A$OK#9b", "packet(OK)damage(a packet with a wrong checksum)"},
        {Sender::Server, "$OK#9", ""},
        {Sender::Server, "$OK#g0", "damage(a packet with a wrong checksum)"},
        {Sender::Server, "+-\x03noise+", "ack()nak()interrupt()ack()"},
        {Sender::Server, "$m4$OK#9a", "packet(OK)"},
        {Sender::Server, "%Stop:T05#99", "note(Stop:T05)"},
        {Sender::Server, "%Stop:T05#00$OK#9a$OK#00",
         "packet(OK)damage(a packet with a wrong checksum)"},
        {Sender::Server, "$0* #7a", "packet(0000)"},
        {Sender::Server, "$0*\"0#ac", "packet(0000000)"},
        {Sender::Client, "$0* #7a", "packet(0* )"},
        {Sender::Server, "$* #4a", "damage(a packet with a malformed run)"},
        {Sender::Server, "$0*#5a", "damage(a packet with a malformed run)"},
        {Sender::Server, "$0*\x1f#79", "damage(a packet with a malformed run)"},
        {Sender::Client,
         "$a}\x03"
         "b#43",
         "packet(a#b)"},
    };
    for (const auto& row : rows) {
        FrameDecoder whole(row.sender);
        whole.Feed(row.wire);
        EXPECT_EQ(FramesIn(whole), row.frames) << row.wire;
    }
    std::string bytes;
    for (int i = 0; i < 256; ++i)
        bytes += static_cast<char>(i);
    FrameDecoder single(Sender::Server);
    std::string frames;
    for (const char byte : Framed(Escaped(bytes))) {
        single.Feed({&byte, 1});
        frames += FramesIn(single);
    }
    EXPECT_EQ(frames, "packet(" + bytes + ")");
    FrameDecoder flooded(Sender::Server);
    flooded.Feed("$" + std::string(kPayloadMax + 1, '0') + "#00+");
    EXPECT_EQ(FramesIn(flooded), "damage(a packet longer than any that was asked for)ack()");
}

GdbOptions Quick(std::chrono::milliseconds timeout = 500ms) {
    GdbOptions options;
    options.server = FindProfile("corvane");
    options.timeout = timeout;
    return options;
}

/// A few accesses of each kind, on a target that is halted, runs and is halted again; throws or
/// gives what was read.
std::string Work(const Address& where, GdbOptions options = Quick()) {
    options.loader = LoaderFile();
    options.ramEnd = 0x20010000;
    GdbTarget target(where, options, kMailbox, {}, {});
    target.LoadProgram("", "");
    std::string bytes(64, '\0');
    for (std::size_t i = 0; i < bytes.size(); ++i)
        bytes[i] = static_cast<char>(i * 5);
    target.Write(bytes.data(), bytes.size(), 0x20000100, 1, 1);
    target.Run();
    std::uint32_t word = 0;
    target.Read(&word, 1, 0x2000100C, 1, 4);
    target.Halt();
    target.Reset(true);
    std::string held(bytes.size(), '\0');
    target.Read(held.data(), held.size(), 0x20000100, 1, 1);
    target.Release(false);
    return held == bytes ? "done" : "wrong bytes";
}

std::string ResultOf(const std::function<std::string()>& work) {
    try {
        return work();
    } catch (const TargetError& error) {
        return error.what();
    }
}

// A payload's answer in place of the session's: once, or each time.
struct Quirk {
    const char* payload;  ///< begins so
    const char* wire;
    const char* result;  ///< a part of the error, or "done"
    int times = 1;
};

TEST(GdbClient, BearsWhatServersDoAndReportsTheRest) {
    const Quirk quirks[] = {
        // Acknowledgements: refused once, twice, accepted but garbled, lost, garbled reply, late
        // stop reply.
        {"qSupported", "-", "done"},
        {"qSupported", "-", "refused \"qSupported", 2},
        {"qSupported", "-$PacketSize=10#91", "done"},
        {"qSupported", "$PacketSize=100#c1", "acknowledged no packet"},
        {"qSupported", "+$PacketSize=100#16", "sent no reply"},
        {"qSupported", "", "acknowledged no packet"},
        {"?", "$T05#b9", "done", 9},
        // The way in.
        {"qSupported", "+$#00", "number of the register sp; --gdb-option sp=NUMBER does"},
        {"qSupported", "+$PacketSize=10#91", "packets of 16 bytes only"},
        {"qSupported", "+$PacketSize=ffffffffffffffffff#5c",
         "number of the register sp; --gdb-option sp=NUMBER does"},
        {"?", "$W00#b7", "no running target (\"W00\")"},
        {"?", "$S00#b3", "done"},
        {"?", "$E01#a6", "answered \"E01\" to \"?\""},
        {"?", "$O41#b4$T05thread:p1.1;#a6", "done"},
        {"?", "%Some:news#8b$T05#b9", "done"},
        {"?", "$T05#b9$T05#b9", "done"},
        // Accesses.
        {"m20000100", "$E03#a8", "Reading 64 x 1 bytes at 0x20000100: the GDB server at"},
        {"m20000100", "$00#60", "answered \"00\" to \"m20000100,40\""},
        {"m20000100", "$00050a0f14#51", "done"},
        {"m20000100", "$0g#97", "answered \"0g\""},
        {"m20000100", "$00#61", "sent a packet with a wrong checksum"},
        {"m20000100", "$0", "sent no reply to \"m20000100,40\" within 0.5 s"},
        {"m20000100", Peer::kClose, "is gone: it closed the connection"},
        {"X20000100,0", "$#00", "done"},
        {"X20000100,4", "$E01#a6", "Writing 64 x 1 bytes at 0x20000100"},
        // Run control.
        {"vCont?", "$#00", "done"},
        {"vCont;c", "$E01#a6", "\"E01\""},
        {"vCont;c", "$T0b#e6", "stopped by itself: SIGSEGV at pc 0x20002000"},
        {"vCont;c", "$T05#b9", "stopped by itself: SIGTRAP at pc 0x20002000"},
        {"vCont;c", "$W00#b7", "has ended"},
        {"\x03", "$O41#b4$T05#b9", "done"},
        {"\x03", "$T05#b9$T02#b6", "done"},
        {"\x03", "$T04#b8", "stopped by itself: SIGILL"},
        {"\x03", "", "didn't stop the target within"},
        // The loader.
        {"qXfer:features", "$#00", "answered \"\" to \"qXfer:features:read:target.xml:0"},
        {"qXfer:features", "$l<target#2f", "no XML"},
        {"qXfer:features", "$l<target/>#9c", "register sp; --gdb-option sp=NUMBER"},
        {"qXfer:features", "$l<target><xi:include href='a'/></target>#f6", "without end", 99},
        {"qXfer:features", "$m#6d", "sends its document target.xml without end"},
        {"m20002000", "$fee7fee600000000#4d", "0x20002003 doesn't hold what was written there"},
        {"P10", "$O48#bb$OK#9a", "done"},
        {"P10", "$O#4f$OK#9a", "done"},
        {"P10", "$E.no such register#a8", "answered \"no such register\" to \"P10"},
        {"P10", "$E01#a6", "answered \"E01\" to \"P10=00000001\""},
        {"P", "$#00", "Loading the program"},
        // The monitor.
        {"qRcmd", "$#00", "takes no monitor commands"},
        {"qRcmd", "$O41#b4$E01#a6", "answered \"E01\" to the monitor command \"reset halt\": A"},
        {"qRcmd", "$O41#b4$O42#b5$OK#9a", "done"},
        {"qRcmd", "$O#4f$T05#b9$OK#9a", "done"},
        {"qRcmd", "$garbage#c9$OK#9a", "answered \"garbage\" to \"qRcmd"},
        {"qRcmd", "$41#65$OK#9a", "sent \"OK\" without being asked"},
        {"qRcmd", "$41#65", "done"},
        {"qRcmd", "$O41#b4", "sent no reply to \"qRcmd"},
    };
    for (const Quirk& quirk : quirks) {
        SCOPED_TRACE(testing::Message() << testing::PrintToString(quirk.payload) << " -> "
                                        << testing::PrintToString(quirk.wire));
        int left = quirk.times;
        Peer peer([&](const std::string& payload) -> std::optional<std::string> {
            if (!payload.starts_with(quirk.payload) || left-- <= 0) return std::nullopt;
            return quirk.wire;
        });
        const std::string result = ResultOf([&] { return Work(peer.Where()); });
        EXPECT_NE(result.find(quirk.result), std::string::npos) << result;
    }
}

/// The session's answer, and more behind it. A program of ours that runs is never taken for
/// crashed.
std::string NumbersIn(const std::string& document) try {
    std::string text;
    for (const auto& [name, number] : ReadRegisterNumbers([&](const std::string& asked) {
             return asked == "target.xml" ? document : "<f><reg name='in-" + asked + "'/></f>";
         }))
        text += name + "=" + std::to_string(number) + " ";
    return text;
} catch (const DescriptionError& error) {
    return error.what();
}

TEST(GdbClient, ReadsTargetDescriptions) {
    std::string deep;
    for (int i = 0; i < 100000; ++i)
        deep += "<a>";
    const struct {
        std::string document;
        std::string found;
    } cases[] = {
        {"<?xml version='1.0'?><!DOCTYPE t [<!ELEMENT t (\"]>\")>]><t\n a = '>' ><!-- <reg> -->"
         "<![CDATA[</t>]]>text<reg name='SP' regnum='13'/><reg name=\"pc\"></reg ></t>",
         "pc=14 sp=13 "},
        {"<t><reg name='a'/><xi:include href='x'/><reg name='b' regnum='0x1F'/></t>",
         "a=0 b=31 in-x=1 "},
        {"<reg name='x' regnum='1x'/>", "the target description numbers a register '1x'"},
        {"",
         "the target description's document target.xml is no XML: an element expected in line "
         "1"},
        {"<t>\n<reg name='a'>\n</t>", "no XML: </reg> expected in line 3"},
        {"<t/></t>", "no XML: no end tag expected"},
        {"<t", "no XML: > expected"},
        {"<t a>", "no XML: = expected"},
        {"<t a=1>", "no XML: a value in quotes expected"},
        {"<t a='1'b='2'>", "no XML: > expected"},
        {"<t a='1>", "no XML: ' expected"},
        {"< t/>", "no XML: a name expected"},
        {"<!- t>", "no XML: a name expected"},
        {"<t/><!-- ->", "no XML: --> expected"},
        {"<t/><!DOCTYPE [>", "no XML: > expected"},
        {deep, "no XML: </a> expected"},
    };
    for (const auto& [document, found] : cases)
        EXPECT_NE(NumbersIn(document).find(found), std::string::npos)
            << document.substr(0, 99) << ": " << NumbersIn(document);
}

TEST(GdbClient, TakesNoStopFromBeforeForACrash) {
    const struct {
        const char* payload;  ///< begins so
        const char* more;
    } rows[] = {
        {"?", "$T05#b9"},    {"P10", "%Stop:T05#99"},         {"vCont;c", "$T05#b9"},
        {"\x03", "$T02#b6"}, {"\x03", "$T02#b6%Stop:T02#96"},
    };
    for (const auto& row : rows) {
        Peer peer([](const std::string&) { return std::nullopt; },
                  [&](const std::string& payload, std::string& wire) {
                      if (payload.starts_with(row.payload)) wire += row.more;
                  },
                  std::make_unique<SimulatedDevice>(ParseDeviceOptions("quen")));
        EXPECT_EQ(ResultOf([&] { return Work(peer.Where()); }), "done")
            << testing::PrintToString(row.payload) << row.more;
    }
}

// What a server in all-stop mode makes of a read while the program runs.
TEST(GdbClient, TriesWhetherARunningTargetCanBeAsked) {
    const struct {
        std::string answer;
        const char* result;
        bool live;
    } rows[] = {
        {Framed("00000000"), "done", true},
        {Framed("E01"), "done", false},
        {"", "done", false},
        {Framed("T0b"), "stopped by itself: SIGSEGV", false},
        {Framed("garbage"), "answered \"garbage\"", false},
    };
    for (const auto& row : rows) {
        bool running = false;
        Peer peer([&](const std::string& payload) -> std::optional<std::string> {
            if (payload == "\x03") running = false;
            if (payload == "vCont;c") running = true;
            if (!running || payload[0] != 'm') return std::nullopt;
            return row.answer;
        });
        GdbOptions options = Quick();
        options.server = FindProfile("generic");
        const std::string result = ResultOf([&] { return Work(peer.Where(), options); });
        EXPECT_NE(result.find(row.result), std::string::npos) << row.answer << ": " << result;
        const auto log = peer.Log();
        EXPECT_EQ(std::count(log.begin(), log.end(), "m2000100c,4"), row.live) << row.answer;
        // Of a server that isn't known, "X" isn't believed.
        EXPECT_TRUE(std::ranges::none_of(log, [](const auto& one) { return one[0] == 'X'; }));
    }
}

// A second server with the same memory needs no stop of the first.
TEST(GdbClient, AsksASecondServerAboutTheRunningTarget) {
    const auto obeys = [](const std::string&) { return std::nullopt; };
    Peer peer(obeys);
    Peer second(obeys);
    GdbOptions options = Quick();
    ParseGdbOption("live=" + second.Where().Text(), options);
    EXPECT_EQ(ResultOf([&] { return Work(peer.Where(), options); }), "done");
    const auto first = peer.Log();
    EXPECT_EQ(std::count(first.begin(), first.end(), "m2000100c,4"), 0);
    const std::vector<std::string> asked{"qSupported", "m2000100c,4"};
    EXPECT_EQ(second.Log(), asked);
    EXPECT_NE(ResultOf([&] { return Work(Peer(obeys).Where(), options); }), "done");
}

// What is refused before anything is touched, and the option that lets it pass.
TEST(GdbClient, FindsOutWhatServersHide) {
    const struct {
        const char* payload;
        const char* wire;
        const char* options;
        const char* result;
    } rows[] = {
        {"m10000000", "$00000000#80", "server=pyocd", "hides reads that fail: it answers"},
        {"m10000000", "$00000000#80", "reads=trusted", "done"},
        {"me000edf0", "$01000000#81", "server=pyocd", "didn't halt the target: it still runs"},
        {"me000edf0", "$03000200#85", "server=pyocd", "done"},
        {"qRcmd,76657273696f6e", "$O426c61636b204d61676963#5c$OK#9a", "timeout=300ms",
         "(packet:vRun)"},
        {"vRun;", "$T05#b9", "reset=packet:vRun", "done"},
        {"R00", "", "reset=packet:R", "done"},
    };
    for (const auto& row : rows) {
        Peer peer([&](const std::string& payload) -> std::optional<std::string> {
            if (!payload.starts_with(row.payload)) return std::nullopt;
            return row.wire;
        });
        GdbOptions options;
        options.timeout = 500ms;
        options.device = {0x20000000, 0x10000000, {{0xE000EDF0, 1, 0x20000}}};
        ParseGdbOption(row.options, options);
        const std::string result = ResultOf([&] { return Work(peer.Where(), options); });
        EXPECT_NE(result.find(row.result), std::string::npos) << row.options << ": " << result;
    }
}

TEST(GdbClient, RefusesALoaderThatDoesNotFit) {
    const struct {
        std::uint32_t ramStart;
        std::uint32_t ramEnd;
        std::uint32_t mailbox;
        const char* refusal;
    } rows[] = {
        {0x20000000, 0x20010000, 0x20001000, ""},
        {0x20003000, 0x20010000, 0x20003000, "outside the RAM (0x20003000-0x2000ffff)"},
        {0x20000000, 0x20002004, 0x20001000, "outside the RAM"},
        {0x20000000, 0x20002010, 0x20001000, "leaves 8 bytes for its stack, below 0x20002010"},
        {0x20000000, 0x20010000, 0x20001FF0, "where its buffers and parameter blocks are"},
    };
    for (const auto& row : rows) {
        Peer peer([](const std::string&) { return std::nullopt; });
        GdbOptions options = Quick();
        options.loader = LoaderFile();
        options.ramEnd = row.ramEnd;
        options.device.ramStart = row.ramStart;
        GdbTarget target(peer.Where(), options, {row.mailbox, 32, 0xFFFFFFFF}, {}, {});
        const std::string result = ResultOf([&] { return target.RequireProgram("", ""), ""; });
        EXPECT_NE(result.find(row.refusal), std::string::npos) << result;
        EXPECT_EQ(result.empty(), *row.refusal == 0) << result;
    }
}

// A server that answers anything else for bytes that were just written isn't believed elsewhere.
TEST(GdbClient, BelievesNoChecksumThatIsNotProved) {
    const struct {
        const char* name;
        const char* payload;  ///< begins so
        const char* answer;   ///< null: what was answered to it first
        const char* result;
    } rows[] = {
        {"right", "(none)", "", "the bytes' own"},
        {"unknown", "qCRC", "", "none"},
        {"always the same", "qCRC", "Cba2db49c", "none"},
        {"kept from the first time", "qCRC", nullptr, "none"},
        {"of RAM, not of flash", "qCRC:0,", "E01", "none"},
        {"of RAM, flash garbled", "qCRC:0,", "Cxyz", "answered \"Cxyz\""},
    };
    const std::string image(3000, 'a');
    for (const auto& row : rows) {
        auto device = std::make_unique<SimulatedDevice>(ParseDeviceOptions("quen,latency=1ns"));
        device->Flash().Preset(0, std::vector<std::uint8_t>(image.begin(), image.end()));
        std::string kept;
        Peer peer([](const std::string&) { return std::nullopt; },
                  [&](const std::string& payload, std::string& wire) {
                      if (!payload.starts_with(row.payload)) return;
                      if (kept.empty()) kept = row.answer == nullptr ? wire : Framed(row.answer);
                      wire = kept;
                  },
                  std::move(device));
        GdbTarget target(peer.Where(), Quick(), kMailbox, {}, {});
        std::string ram(0x1000, 'r');
        target.Write(ram.data(), ram.size(), 0x20001000, 1, 1);
        const std::string result = ResultOf([&] {
            const auto crc = target.Checksum(0, 3000);
            if (!crc) return "none";
            return *crc == base::AddToCrc32(base::kCrc32Begin, image) ? "the bytes' own" : "wrong";
        });
        EXPECT_NE(result.find(row.result), std::string::npos) << row.name << ": " << result;
        if (!result.starts_with("Summing")) {
            std::string now(ram.size(), '?');
            target.Read(now.data(), now.size(), 0x20001000, 1, 1);
            EXPECT_EQ(now, ram) << row.name;
        }
    }
}

// The manual's table is the one in the source.
TEST(GdbProfiles, AreInTheManual) {
    std::ostringstream text;
    text << std::ifstream(BOARDS_MANUAL).rdbuf();
    const std::string manual = text.str();
    for (const Profile& row : Profiles()) {
        const std::string line = std::string("| ") + row.title + " | `" + row.name + "` | `" +
                                 row.start + "` | `" + row.options + "` | " + row.tried + " |\n";
        EXPECT_NE(manual.find(line), std::string::npos) << line;
    }
    for (const GdbOptionRow& row : GdbOptionTable())
        EXPECT_NE(manual.find(std::string("`") + row.name + "="), std::string::npos) << row.name;
}

bool IsOptional(const std::string& payload) {
    return payload.starts_with("qSupported") || payload == "QStartNoAckMode" ||
           payload == "vCont?" || payload.ends_with(",0:");
}

// Whichever request fails, and however: what can be done without is done without, the rest is an
// error, and nobody waits for long.
TEST(GdbClient, ReportsAFailureOfAnyRequest) {
    std::size_t count = 0;
    for (const char* wire : {"+$E01#a6", "+$zz#f4", "", Peer::kClose}) {
        for (const bool forGood : {false, true}) {
            for (std::size_t failing = 0; failing == 0 || failing < count; ++failing) {
                std::size_t index = 0;
                std::string failed;
                Peer peer([&](const std::string& payload) -> std::optional<std::string> {
                    const std::size_t at = index++;
                    if (at < failing || (at > failing && !forGood)) return std::nullopt;
                    if (at == failing) failed = payload;
                    return wire;
                });
                const auto start = std::chrono::steady_clock::now();
                const std::string result =
                    ResultOf([&] { return Work(peer.Where(), Quick(60ms)); });
                count = std::max(count, peer.Log().size());
                const bool optional = IsOptional(failed) && !forGood;
                EXPECT_TRUE(result == "done"
                                ? optional
                                : result.find("GDB server at 127.0.0.1:") != result.npos)
                    << failing << " " << failed << " -> " << wire << ": " << result;
                EXPECT_LT(std::chrono::steady_clock::now() - start, 10s);
            }
        }
    }
    EXPECT_GT(count, 15U);
}

TEST(GdbClient, KeepsToThePacketSizeAndCutsAtWords) {
    std::mt19937 random(1);
    for (const std::size_t packetSize : {0x40U, 0x43U, 0x100U, 0x400U, 0x4000U, 0U}) {
        for (const bool binary : {true, false}) {
            const std::size_t limit = packetSize == 0 ? 400 : packetSize;
            std::uint64_t end = 0;
            std::string breach;
            Peer peer([&](const std::string& payload) -> std::optional<std::string> {
                Arguments request;
                const std::string_view rest = std::string_view(payload).substr(1);
                const bool reads = payload.starts_with("m");
                if (reads) Range(rest, request);
                if (payload.starts_with("M")) HexBytes(rest, request);
                if (payload.starts_with("X")) BinaryBytes(rest, request);
                const std::size_t size = reads ? 2 * request.length : Escaped(payload).size();
                const std::uint32_t behind = request.address + request.length;
                const bool cut = reads || !request.data.empty();
                if (size + kFrameSize > limit || (cut && behind % 4 != 0 && behind != end))
                    breach = Shown(payload);
                if (payload.starts_with("qSupported"))
                    return "+" +
                           Framed(packetSize == 0
                                      ? ""
                                      : "PacketSize=" + base::ToHex(std::string{
                                                            static_cast<char>(packetSize >> 8),
                                                            static_cast<char>(packetSize)}));
                if (payload.starts_with("X") && !binary) return "+" + Framed("");
                return std::nullopt;
            });
            GdbTarget target(peer.Where(), Quick(5s), kMailbox, {}, {});
            for (const std::size_t around : {std::size_t{4}, limit / 2 - 10, limit - 20, limit}) {
                for (std::uint32_t i = 0; i < 4; ++i) {
                    std::string bytes(around + i, '\0');
                    for (char& byte : bytes)
                        byte = "#$}*\x03\x00+a"[random() % 8];
                    const std::uint32_t address = 0x20002000 + i;
                    end = address + bytes.size();
                    target.Write(bytes.data(), bytes.size(), address, 1, 1);
                    std::string held(bytes.size(), '?');
                    target.Read(held.data(), held.size(), address, 1, 1);
                    EXPECT_EQ(held, bytes) << packetSize << (binary ? " X" : " M");
                }
            }
            const std::uint32_t word = 0x12345678;
            target.Write(&word, 1, 0x400FD000, 1, 4);
            EXPECT_EQ(peer.Log().back(), "M400fd000,4:78563412");
            EXPECT_EQ(breach, "") << packetSize;
        }
    }
}

// What a server in non-stop mode answers while the program runs, and whether that makes the client
// look without stopping it.
TEST(GdbClient, ReadsARunningTargetWhereTheServerCan) {
    const struct {
        const char* look;  ///< the answer to a read while the program runs; null: the bytes
        const char* news;  ///< sent along with it
        const char* result;
        bool live;
        const char* stop = "+$OK#9a%Stop:T00#94";  ///< the answer to the request to stop
    } rows[] = {
        {nullptr, "", "done", true},
        {"$E01#a6", "", "done", false},
        {"", "", "done", false},
        {"", "", "done", false, "+$E01#a6$OK#9a%Stop:T00#94"},
        {nullptr, "%Stop:T0bthread:1;#e4", "stopped by itself: SIGSEGV", true},
        {nullptr, "", "answered \"E22\" to \"vCont;t\"", true, "+$E22#a9"},
    };
    for (const auto& row : rows) {
        bool nonStop = false;
        bool running = false;
        Peer peer([&](const std::string& payload) -> std::optional<std::string> {
            if (payload.starts_with("qSupported"))
                return "+" + Framed("QNonStop+;qXfer:features:read+");
            if (payload.starts_with("QNonStop:")) {
                nonStop = payload.back() == '1';
                return "+$OK#9a";
            }
            if (!nonStop) return std::nullopt;
            if (payload == "vCont;c") {
                running = true;
                return "+$OK#9a";
            }
            if (payload == "vCont;t") {
                running = false;
                return row.stop;
            }
            if (payload == "vStopped") return "+$OK#9a";
            if (!running || payload[0] != 'm') return std::nullopt;
            if (row.look != nullptr) return std::string("+") + row.look;
            return "+" + Framed("00000000") + row.news;
        });
        const std::string result = ResultOf([&] { return Work(peer.Where()); });
        EXPECT_NE(result.find(row.result), std::string::npos) << result;
        const auto log = peer.Log();
        EXPECT_EQ(std::count(log.begin(), log.end(), "\x03") == 0, row.live);
    }
}

// What clients ask and how they go on, each line with a session of its own; a flash of one sector
// and an eighth. An interrupt stands as "^C".
TEST(GdbServer, AnswersByTheProtocol) {
    const struct {
        std::vector<std::string> requests;
        const char* replies;
        const char* device = "dorna,flash=18K";
    } rows[] = {
        {{"?", "vFlashErase:0,8000", "vFlashErase:4000,4000", "vFlashErase:0,4800"},
         "T05thread:1; OK OK E01 "},
        {{"vFlashErase:0,c000", "vFlashErase:8000,0", "vFlashErase:8000,4000"}, "E01 E01 E01 "},
        {{"vFlashErase:0,4000"}, "E01 ", "dorna,erase=never"},
        {{"vFlashWrite:0:abcd", "vFlashWrite:1:a", "vFlashDone"}, "OK E01 OK "},
        // A step ends at once; an interrupt between two answers the next resume.
        {{"s100", "pf", "^C", "c", "^C"}, "T02thread:1; 00010000 T02thread:1; "},
        {{"s", "^C", "?", "c", "^C"}, "T02thread:1; T05thread:1; T02thread:1; "},
        {{"^C", "c", "m0,4", "^C"}, "E01 T02thread:1; "},
        {{"vCont;c:zz", "vCont;C0:1", "vCont;s:p1.-1;c:-1", "vCont;s:1;c:zz", "vCont;"},
         "E01 E01 T02thread:1; E01 E01 "},
        {{"Z0,100,2", "z1,100,4;cond", "Z5,100,2", "Z0,x"}, "OK OK E01 E01 "},
        {{"m0,0", "m20000000,2", "M20000000,2:abcd", "m20000000,2"}, "E01 ffff OK abcd "},
        {{"qRcmd,68616c74", "qRcmd,7265736574", "c", "^C", "qRcmd,726573756d65"},
         "OK OK T02thread:1; OK "},
        {{"qRcmd,726573657420696e6974", "qRcmd,726573657420"}, "OK E01 "},
    };
    for (const auto& row : rows) {
        SimulatedDevice device(ParseDeviceOptions(row.device));
        ServedSimulation served(
            device, [](const std::string&) {}, [] {});
        Session session(served, [](const std::string& text) {
            EXPECT_EQ(text.find("page 1"), text.npos) << text;
        });
        std::string replies;
        for (const std::string& request : row.requests)
            for (const std::string& reply :
                 request == "^C" ? session.Interrupt() : session.Answer(request))
                if (!reply.starts_with('O') || reply == "OK") replies += reply + " ";
        EXPECT_EQ(replies, row.replies) << row.requests[0];
    }
}

// As much as GDB asks for at a PacketSize; erases and writes take their time; what a real device
// would ignore is told without end.
TEST(GdbServer, FillsAPacketTakesItsTimeAndTellsWhatIsIgnored) {
    SimulatedDevice device(ParseDeviceOptions("quen,erase-time=1s,chunk-time=1s,latency=1s"));
    std::size_t told = 0;
    ServedSimulation served(
        device, [&](const std::string&) { ++told; }, [] {});
    Session session(served, [](const std::string&) {});
    session.Answer("?");
    EXPECT_EQ(session.Answer("m0,2000").at(0).size(), 0x4000U);
    EXPECT_EQ(session.Answer("m0,9000").at(0).size(), 0x4000U);
    const auto before = device.Now();
    session.Answer("vFlashErase:0,800");
    session.Answer("vFlashWrite:0:" + std::string(0x801, 'x'));
    EXPECT_EQ(std::chrono::round<std::chrono::seconds>(device.Now() - before), 6s);
    for (int i = 0; i < 1500; ++i)
        session.Answer("M400fd008,4:02000000");
    EXPECT_EQ(told, 1500U);
}

/// A client that only speaks: what it is answered until it is let go, or nothing more comes.
std::string Said(Socket& client, const std::string& bytes) {
    std::string answer;
    try {
        client.Write(bytes, After(1s));
        for (std::string more = "?"; !more.empty(); answer += more)
            more = client.Read(After(300ms));
    } catch (const SocketError&) {
        answer += "(closed)";
    }
    return answer;
}

// One who only connects holds nobody up; a second one is told; who hung up, and who isn't a
// debugger, is served nothing.
TEST(GdbServer, ServesTheFirstWhoAsks) {
    SimulatedDevice device(ParseDeviceOptions("quen"));
    ServedSimulation served(
        device, [](const std::string&) {}, [] {});
    std::atomic<bool> done = false;
    Server server(
        served, Address::Parse("127.0.0.1:0"), [&] { return done.load(); },
        [](const std::string&) {});
    const Address where = Address::Parse("127.0.0.1:" + std::to_string(server.Port()));
    const auto connect = [&] { return Socket::Connect(where, After(1s), {}); };
    Socket silent = connect();
    Socket gone = connect();
    const std::string load = Framed("vFlashErase:0,400") + Framed("vFlashWrite:0:gone");
    gone.Write(load, After(1s));
    gone.Close();
    std::thread thread([&] { server.Run(); });
    Socket browser = connect();
    EXPECT_EQ(Said(browser, "POST / HTTP/1.1\r\n\r\n" + load), "(closed)");
    Socket first = connect();
    EXPECT_EQ(Said(first, "+$?#3f"), "+" + Framed("T05thread:1;"));
    Socket second = connect();
    EXPECT_EQ(Said(second, "+$?#3f"), "+" + Framed("E.serves another client") + "(closed)");
    EXPECT_NE(ResultOf([&] { return Work(where); }).find("serves another client"),
              std::string::npos);
    EXPECT_EQ(Said(first, "+$m0,4#fd"), "+$ffffffff#30");
    first.Close();
    EXPECT_EQ(Said(silent, "$?#3f"), "+" + Framed("T05thread:1;"));
    done = true;
    thread.join();
}

}  // namespace
