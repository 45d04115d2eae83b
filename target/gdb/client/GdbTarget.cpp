// From the calls of a target to requests, and from replies to errors that say what was asked.

#include "target/gdb/client/GdbTarget.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstring>
#include <limits>
#include <thread>

#include "base/ByteOrder.h"

namespace target::gdb {

namespace {

using std::chrono::milliseconds;

// What a program needs before it takes its first order, on a slow clock and through a slow probe.
constexpr milliseconds kStartUp(20);

bool HoldsWord(std::string_view bytes, std::uint32_t word) {
    const std::string wanted = base::WordBytes(word);
    for (std::size_t i = 0; i + 4 <= bytes.size(); i += 4)
        if (bytes.substr(i, 4) == wanted) return true;
    return false;
}

std::size_t CheckedSize(std::size_t count, std::uint32_t address, std::size_t width) {
    if (width != 1 && width != 2 && width != 4)
        throw ProtocolError("isn't asked: elements are 1, 2 or 4 bytes wide");
    if (address % width != 0)
        throw ProtocolError(fmt::format("isn't asked: the address is no multiple of {}", width));
    const std::uint64_t room =
        std::numeric_limits<std::uint32_t>::max() - address + std::uint64_t{1};
    if (count > room / width)
        throw ProtocolError("isn't asked: the range runs past the end of the address space");
    return count * width;
}

Connection Connect(const Address& address, const GdbOptions& options,
                   const InterruptCheck& interrupted, const PacketTrace& trace) try {
    return {Socket::Connect(address, After(options.timeout), interrupted), options.timeout, trace};
} catch (const SocketError& error) {
    throw TargetError(fmt::format(
        "can't connect to the GDB server at {}: {}; is it running, and is that its port?",
        address.Text(), error.what()));
}

}  // namespace

GdbTarget::GdbTarget(const Address& address, const GdbOptions& options, const Mailbox& mailbox,
                     InterruptCheck interrupted, const PacketTrace& trace)
    : name_(address.Text()),
      options_(options),
      mailbox_(mailbox),
      interrupted_(std::move(interrupted)),
      ramEnd_(options.ramEnd),
      connection_(Connect(address, options, interrupted_, trace)),
      memory_(connection_),
      core_(connection_) {
    Perform([] { return std::string("Connecting to the target"); }, [&] { Attach(); });
}

void GdbTarget::Perform(const Text& describe, const std::function<void()>& action) {
    try {
        action();
    } catch (const ProtocolError& error) {
        if (dynamic_cast<const StoppedByItself*>(&error) != nullptr) started_ = false;
        throw TargetError(
            fmt::format("{}: the GDB server at {} {}", describe(), name_, error.what()));
    }
}

void GdbTarget::Attach() {
    features_ = ParseFeatures(connection_.Ask("qSupported:vContSupported+"));
    if (features_.packetSize < MemoryPort::kPacketSizeMin)
        throw ProtocolError(fmt::format("takes packets of {} bytes only, too few for any access",
                                        features_.packetSize));
    memory_.SetPacketSize(features_.packetSize);
    if (features_.noAckMode && connection_.Agrees("QStartNoAckMode"))
        connection_.StopAcknowledging();
    for (const std::string& command : options_.init)
        Monitor(command);
    if (options_.attach) {
        const std::string reply = connection_.Ask(fmt::format("vAttach;{:x}", *options_.attach));
        const auto stop = ParseStopReply(reply);
        if (!stop || stop->kind != StopReply::Kind::Stopped)
            throw ProtocolError(
                fmt::format("answered \"{}\" to the request to attach", Shown(reply)));
    }
    core_.Attach();
}

void GdbTarget::Read(void* buffer, std::size_t count, std::uint32_t address, int /*page*/,
                     std::size_t width) {
    const auto describe = [&] {
        return fmt::format("Reading {} x {} bytes at 0x{:08X}", count, width, address);
    };
    Perform(describe, [&] {
        const std::size_t size = CheckedSize(count, address, width);
        if (size == 0) return;
        const bool look = started_ && InMailbox(address, size);
        StopForAccess();
        const std::string bytes = look ? ReadMailbox(address, size) : memory_.Read(address, size);
        std::memcpy(buffer, bytes.data(), size);
        // Whoever has looked at something else, or has found the program busy, waits now.
        const bool waits = !look || HoldsWord(bytes, mailbox_.busyWord);
        if (started_ && waits && !core_.IsRunning()) Resume();
    });
}

void GdbTarget::Write(const void* buffer, std::size_t count, std::uint32_t address, int /*page*/,
                      std::size_t width) {
    const auto describe = [&] {
        return fmt::format("Writing {} x {} bytes at 0x{:08X}", count, width, address);
    };
    Perform(describe, [&] {
        const std::size_t size = CheckedSize(count, address, width);
        if (size == 0) return;
        StopForAccess();
        const std::string_view bytes(static_cast<const char*>(buffer), size);
        memory_.Write(address, bytes);
        if (look_ && InMailbox(address, size))
            look_->replace(address - mailbox_.address, size, bytes);
        else if (OverlapsMailbox(address, size))
            look_.reset();
    });
}

/// The core is stopped, or can be asked as it runs.
void GdbTarget::StopForAccess() {
    if (!core_.IsRunning()) return;
    if (core_.IsLive())
        core_.RequireRunning();
    else
        core_.Stop();
}

std::string GdbTarget::ReadMailbox(std::uint32_t address, std::size_t size) {
    if (core_.IsRunning()) return memory_.Read(address, size);
    if (!look_) look_ = memory_.Read(mailbox_.address, mailbox_.sizeBytes);
    return look_->substr(address - mailbox_.address, size);
}

bool GdbTarget::InMailbox(std::uint32_t address, std::size_t size) const {
    const std::uint64_t end = std::uint64_t{address} + size;
    return address >= mailbox_.address &&
           end <= std::uint64_t{mailbox_.address} + mailbox_.sizeBytes;
}

bool GdbTarget::OverlapsMailbox(std::uint32_t address, std::size_t size) const {
    return std::uint64_t{address} + size > mailbox_.address &&
           address < std::uint64_t{mailbox_.address} + mailbox_.sizeBytes;
}

void GdbTarget::Resume() {
    look_.reset();
    core_.Resume();
}

void GdbTarget::Run() {
    Perform([] { return std::string("Running the target"); },
            [&] {
                if (started_) throw ProtocolError("isn't asked: the target is running already");
                look_.reset();
                if (features_.nonStop && !liveTried_) core_.TryLive(mailbox_.address);
                liveTried_ = true;
                if (!core_.IsRunning()) core_.Resume();
                started_ = true;
                std::this_thread::sleep_for(kStartUp);
            });
}

void GdbTarget::Halt() {
    Perform([] { return std::string("Halting the target"); },
            [&] {
                core_.Stop();
                started_ = false;
            });
}

// How a server resets is its monitor command's business.
void GdbTarget::Reset(bool /*flag*/) {
    const auto describe = [&] {
        return fmt::format("Resetting the target (monitor {})", options_.reset);
    };
    Perform(describe, [&] {
        core_.Stop();
        started_ = false;
        look_.reset();
        Monitor(options_.reset);
    });
}

void GdbTarget::Pause(std::uint32_t pauseMs) {
    Perform([] { return std::string("Letting the target run"); },
            [&] {
                if (started_ && !core_.IsRunning()) Resume();
            });
    constexpr milliseconds kSlice(50);
    const Deadline end = After(milliseconds(pauseMs));
    while (std::chrono::steady_clock::now() < end && !(interrupted_ && interrupted_()))
        std::this_thread::sleep_until(std::min(end, After(kSlice)));
}

void GdbTarget::Release(bool start) {
    if (connection_.IsLost()) return;
    Perform([] { return std::string("Leaving the target"); },
            [&] {
                if (start && !options_.detach) {
                    if (!core_.IsRunning()) core_.Resume();
                } else {
                    core_.Stop();
                    started_ = false;
                }
                try {
                    if (options_.detach) connection_.Ask("D");
                } catch (const ProtocolError&) {
                    // Some servers close the connection in place of a reply.
                }
                connection_.Close();
            });
}

}  // namespace target::gdb
