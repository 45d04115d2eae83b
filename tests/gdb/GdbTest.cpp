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
#include "tests/support/Cases.h"

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
    for (const auto& row : test::ReadTable("gdb/frames.txt", 3)) {
        FrameDecoder whole(row[0] == "Server" ? Sender::Server : Sender::Client);
        whole.Feed(test::Unescaped(row[1]));
        EXPECT_EQ(FramesIn(whole), row[2]) << row[1];
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

TEST(GdbClient, BearsWhatServersDoAndReportsTheRest) {
    for (const auto& row : test::ReadTable("gdb/answers.txt", 5)) {
        SCOPED_TRACE(row[0] + " -> " + row[1]);
        const std::string request = test::Unescaped(row[0]);
        const std::string wire = test::Unescaped(row[1]);
        const bool behind = wire.starts_with("...");
        int left = row[4].empty() ? 1 : std::stoi(row[4]);
        Peer peer(
            [&](const std::string& payload) -> std::optional<std::string> {
                if (behind || !payload.starts_with(request) || left-- <= 0) return std::nullopt;
                return wire;
            },
            [&](const std::string& payload, std::string& answer) {
                if (behind && payload.starts_with(request)) answer += wire.substr(3);
            },
            std::make_unique<SimulatedDevice>(ParseDeviceOptions("quen")));
        GdbOptions options = Quick();
        if (!row[3].empty()) {
            options.server = GdbOptions().server;
            options.device = {0x20000000, 0x10000000, {{0xE000EDF0, 1, 0x20000}}};
            ParseGdbOption(row[3], options);
        }
        const std::string result = ResultOf([&] { return Work(peer.Where(), options); });
        EXPECT_NE(result.find(row[2]), std::string::npos) << result;
    }
}

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
    for (const auto& row : test::ReadTable("gdb/descriptions.txt", 2))
        EXPECT_NE(NumbersIn(test::Unescaped(row[0])).find(row[1]), std::string::npos)
            << row[0] << ": " << NumbersIn(test::Unescaped(row[0]));
    std::string deep;
    for (int i = 0; i < 100000; ++i)
        deep += "<a>";
    EXPECT_NE(NumbersIn(deep).find("no XML: </a> expected"), std::string::npos);
}

TEST(GdbClient, ReadsARunningTargetWhereTheServerCan) {
    const std::string ok = "+$OK#9a";
    for (const auto& row : test::ReadTable("gdb/running.txt", 5)) {
        const bool nonStop = row[0] == "non-stop";
        bool agreed = false;
        bool running = false;
        Peer peer([&](const std::string& payload) -> std::optional<std::string> {
            if (nonStop && payload.starts_with("qSupported"))
                return "+" + Framed("QNonStop+;qXfer:features:read+");
            if (payload.starts_with("QNonStop:")) agreed = payload.back() == '1';
            if (payload.starts_with("QNonStop:") || payload == "vStopped") return ok;
            if (agreed != nonStop) return std::nullopt;
            if (payload == "vCont;c") running = true;
            if (payload == "vCont;c" && nonStop) return ok;
            if (payload == "\x03" || payload == "vCont;t") running = false;
            if (payload == "vCont;t") return row[4].empty() ? "+$OK#9a%Stop:T00#94" : row[4];
            if (!running || payload[0] != 'm') return std::nullopt;
            return row[1];
        });
        GdbOptions options = Quick();
        if (!nonStop) options.server = FindProfile("generic");
        const std::string result = ResultOf([&] { return Work(peer.Where(), options); });
        EXPECT_NE(result.find(row[3]), std::string::npos) << row[1] << ": " << result;
        const auto log = peer.Log();
        const bool looked = nonStop ? std::count(log.begin(), log.end(), "\x03") == 0
                                    : std::count(log.begin(), log.end(), "m2000100c,4") == 1;
        EXPECT_EQ(looked, row[2] == "looks") << row[0] << row[1];
        // Of a server that isn't known, "X" isn't believed.
        if (nonStop) continue;
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

TEST(GdbClient, RefusesALoaderThatDoesNotFit) {
    struct Row {
        std::uint32_t ramStart, ramEnd, mailbox;
        const char* refusal;
    };
    for (const Row& row :
         {Row{0x20000000, 0x20010000, 0x20001000, ""},
          {0x20003000, 0x20010000, 0x20003000, "outside the RAM (0x20003000-0x2000ffff)"},
          {0x20000000, 0x20002004, 0x20001000, "outside the RAM"},
          {0x20000000, 0x20002010, 0x20001000, "leaves 8 bytes for its stack, below 0x20002010"},
          {0x20000000, 0x20010000, 0x20001FF0, "where its buffers and parameter blocks are"}}) {
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

TEST(GdbServer, AnswersByTheProtocol) {
    for (const auto& row : test::ReadTable("gdb/requests.txt", 3)) {
        SimulatedDevice device(ParseDeviceOptions(row[2].empty() ? "dorna,flash=18K" : row[2]));
        ServedSimulation served(
            device, [](const std::string&) {}, [] {});
        Session session(served, [](const std::string& text) {
            EXPECT_EQ(text.find("page 1"), text.npos) << text;
        });
        std::string replies;
        for (const std::string& request : test::Split(row[0], "; "))
            for (const std::string& reply :
                 request == "^C" ? session.Interrupt() : session.Answer(request))
                if (!reply.starts_with('O') || reply == "OK") replies += " " + reply;
        EXPECT_EQ(replies, " " + row[1]) << row[0];
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
