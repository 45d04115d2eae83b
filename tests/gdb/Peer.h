// Peer: a GDB server with the simulated device behind it, which follows a script and misbehaves
// where the script says so.

#pragma once

#include <atomic>
#include <chrono>
#include <functional>
#include <initializer_list>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "target/gdb/server/Session.h"
#include "target/gdb/wire/Frame.h"
#include "target/gdb/wire/Socket.h"
#include "target/simulated/ServedSimulation.h"
#include "tests/support/TemporaryDirectory.h"

namespace test {

using target::ParseDeviceOptions;
using target::ServedSimulation;
using target::SimulatedDevice;
using target::gdb::Address;
using target::gdb::After;
using target::gdb::Frame;
using target::gdb::Framed;
using target::gdb::FrameDecoder;
using target::gdb::Session;
using target::gdb::Socket;
using target::gdb::SocketError;

/// For one client, bounded in time.
class Peer {
  public:
    /// Sees each payload (an interrupt as "\x03") and may give the bytes to send instead of doing
    /// what it asks; kClose closes the connection, after what stands before it.
    using Hook = std::function<std::optional<std::string>(const std::string& payload)>;

    /// Sees the bytes that answer what was done, and may change them.
    using Bend = std::function<void(const std::string& payload, std::string& wire)>;

    static constexpr char kClose[] = "(close)";

    explicit Peer(Hook hook, const char* device = "quen,latency=1ns,bandwidth=0")
        : Peer(std::move(hook), {}, std::make_unique<SimulatedDevice>(ParseDeviceOptions(device))) {
    }
    Peer(Hook hook, Bend bend, std::unique_ptr<SimulatedDevice> device)
        : device_(std::move(device)),
          served_(
              *device_, [](const std::string&) {}, [] {}),
          hook_(std::move(hook)),
          bend_(std::move(bend)),
          listener_(Socket::Listen(Address::Parse("127.0.0.1:0"), [this] { return done_.load(); })),
          address_(Address::Parse("127.0.0.1:" + std::to_string(listener_.Port()))),
          thread_([this] { Serve(); }) {}
    ~Peer() {
        done_ = true;
        thread_.join();
    }

    Address Where() const { return address_; }
    SimulatedDevice& Device() { return *device_; }
    ServedSimulation& Served() { return served_; }
    std::vector<std::string> Log() {
        done_ = true;
        if (thread_.joinable()) thread_.join();
        thread_ = std::thread([] {});
        return log_;
    }

  private:
    void Serve() try {
        Socket client;
        while (!done_ && !client.IsOpen())
            client = listener_.Accept(After(std::chrono::seconds(1)));
        Session session(served_, [](const std::string&) {});
        FrameDecoder decoder(FrameDecoder::Sender::Client);
        while (!done_ && client.IsOpen()) {
            decoder.Feed(client.Read(After(std::chrono::milliseconds(20))));
            while (const auto frame = decoder.Next())
                Answer(client, session, *frame);
        }
    } catch (const SocketError&) {
    }

    void Answer(Socket& client, Session& session, const Frame& frame) {
        const bool interrupt = frame.kind == Frame::Kind::Interrupt;
        if (frame.kind != Frame::Kind::Packet && !interrupt) return;
        const std::string payload = interrupt ? "\x03" : frame.payload;
        log_.push_back(payload);
        std::string wire = session.AcknowledgesPackets() && !interrupt ? "+" : "";
        const auto replies = interrupt ? session.Interrupt() : std::vector<std::string>();
        if (const auto instead = hook_(payload)) {
            wire = *instead;
        } else {
            for (const std::string& reply : interrupt ? replies : session.Answer(payload))
                wire += Framed(reply);
            if (bend_) bend_(payload, wire);
        }
        const std::size_t close = wire.find(kClose);
        client.Write(wire.substr(0, close), After(std::chrono::seconds(1)));
        if (close != wire.npos) throw SocketError("as the script says");
    }

    const std::unique_ptr<SimulatedDevice> device_;
    ServedSimulation served_;
    const Hook hook_;
    const Bend bend_;
    std::atomic<bool> done_ = false;
    std::vector<std::string> log_;
    Socket listener_;
    const Address address_;
    std::thread thread_;
};

/// What becomes of one answer of a server; `late` is sent in front of the next one. Or what is sent
/// in place of doing what is asked.
struct ReplyFault {
    const char* name;
    char letter;
    void (*bend)(std::string& wire, std::string& late);
    const char* instead = nullptr;
};

inline constexpr ReplyFault kReplyFaults[] = {
    {"dropped", 'd', [](std::string& wire, std::string&) { wire.clear(); }},
    {"damaged", 'x',
     [](std::string& wire, std::string&) {
         if (!wire.empty()) wire.back() ^= 1;
     }},
    {"doubled", '2', [](std::string& wire, std::string&) { wire += wire; }},
    {"late", 'l', [](std::string& wire, std::string& late) { late = std::exchange(wire, ""); }},
    {"cut", 'c',
     [](std::string& wire, std::string&) {
         wire = wire.substr(0, wire.size() / 2) + Peer::kClose;
     }},
    {"said to have failed", 'e', [](std::string& wire, std::string&) { wire = "+$E01#a6"; }},
    {"refused", 'r', nullptr, "+$E01#a6"},
    {"lost", 'n', nullptr, ""},
};

/// One packet of all meets a fault. Outlives the peer that it is for.
class OneFault {
  public:
    OneFault(const ReplyFault& fault, std::size_t failing) : fault_(fault), failing_(failing) {}

    Peer::Hook Instead() {
        return [this](const std::string& payload) -> std::optional<std::string> {
            if (Packets() == failing_) asked_ = payload.substr(0, 30);
            if (fault_.instead == nullptr || packets_++ != failing_) return std::nullopt;
            return fault_.instead;
        };
    }
    Peer::Bend Bend() {
        return [this](const std::string&, std::string& wire) {
            if (fault_.instead != nullptr) return;
            wire.insert(0, std::exchange(late_, ""));
            if (packets_++ == failing_) fault_.bend(wire, late_);
        };
    }

    std::size_t Packets() const { return packets_; }
    const std::string& Asked() const { return asked_; }

  private:
    const ReplyFault& fault_;
    const std::size_t failing_;
    std::size_t packets_ = 0;
    std::string late_;
    std::string asked_;
};

inline std::string Little(std::initializer_list<std::uint32_t> words) {
    std::string bytes;
    for (const std::uint32_t word : words)
        for (int i = 0; i < 4; ++i)
            bytes += static_cast<char>(word >> (8 * i));
    return bytes;
}

/// The smallest program: one segment of four bytes, and as many behind it that aren't in the file.
inline const std::string& LoaderFile() {
    static const std::string path = [] {
        static const TemporaryDirectory directory;
        return directory.Write("loader.out",
                               "\x7f"
                               "ELF\1\1\1" +
                                   std::string(9, '\0') +
                                   Little({0x00280002, 1, 0x20002001, 52, 0, 0, 0x00200034, 1, 0}) +
                                   Little({1, 84, 0, 0x20002000, 4, 8, 7, 4}) + "\xfe\xe7\xfe\xe7");
    }();
    return path;
}

}  // namespace test
