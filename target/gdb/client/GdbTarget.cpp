// From the calls of a target to requests, and from replies to errors that say what was asked.

#include "target/gdb/client/GdbTarget.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstring>
#include <limits>
#include <thread>
#include <utility>

#include "base/ByteOrder.h"
#include "base/Hex.h"
#include "target/gdb/client/Texts.h"

namespace target::gdb {

namespace {

using std::chrono::milliseconds;

// What is known of the program, true between any two calls:
// - started_: it was let go, and neither Halt, Reset nor a crash has come since. It runs, or we
//   have stopped it for a moment.
// - crash_: how it stopped by itself. It stays until Halt or Reset, so that every read of the
//   mailbox says it again; started_ is false then.
// - mailboxBytes_: the mailbox as it is in this stop. Our writes go into it. It is dropped before
//   the program goes on, and when others may have written there.
// After an error either the server has refused the request, and all is as before it, or the
// connection is lost, and every later call fails with the same reason.

// What a program needs before it takes its first order, on a slow clock and through a slow probe.
constexpr milliseconds kStartUp(20);

constexpr char kPacket[] = "packet:";

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

}  // namespace

Connection GdbTarget::Connect(const Address& address) const try {
    return {Socket::Connect(address, After(options_.timeout), interrupted_), options_.timeout,
            trace_};
} catch (const SocketError& error) {
    throw TargetError(fmt::format(
        "can't connect to the GDB server at {}: {}; is it running, and is that its port?",
        address.Text(), error.what()));
}

GdbTarget::GdbTarget(const Address& address, const GdbOptions& options, const Mailbox& mailbox,
                     InterruptCheck interrupted, PacketTrace trace)
    : name_(address.Text()),
      options_(options),
      mailbox_(mailbox),
      interrupted_(std::move(interrupted)),
      trace_(std::move(trace)),
      ramEnd_(options.ramEnd),
      connection_(Connect(address)),
      memory_(connection_),
      core_(connection_) {
    Perform([] { return std::string("Connecting to the target"); }, [&] { Attach(); });
}

GdbTarget::GdbTarget(const Address& address, const GdbOptions& options, const Mailbox& mailbox,
                     InterruptCheck interrupted, PacketTrace trace, Lent /*connected only*/)
    : name_(address.Text()),
      options_(options),
      mailbox_(mailbox),
      interrupted_(std::move(interrupted)),
      trace_(std::move(trace)),
      ramEnd_(options.ramEnd),
      connection_(Connect(address)),
      memory_(connection_),
      core_(connection_) {}

void GdbTarget::Join(const Features& features, bool stopped) {
    Perform([] { return std::string("Connecting to the target"); },
            [&] {
                SetFeatures(features);
                FindOut(stopped);
            });
}

void GdbTarget::Perform(const Text& describe, const std::function<void()>& action) {
    const auto sentence = [&](const char* what) {
        return fmt::format("{}: the GDB server at {} {}", describe(), name_, what);
    };
    try {
        action();
    } catch (const StoppedByItself& error) {
        started_ = false;
        mailboxBytes_.reset();
        crash_ = error.what() + WhereStopped();
        throw TargetError(sentence(crash_.c_str()));
    } catch (const ProtocolError& error) {
        throw TargetError(sentence(error.what()));
    }
}

std::optional<std::uint32_t> GdbTarget::ProgramCounter() try {
    const std::string reply =
        connection_.Ask(fmt::format("p{:x}", RegisterNumber("pc", options_.pc)));
    const auto bytes = base::FromHex(reply);
    if (!bytes || bytes->size() < 4) return std::nullopt;
    return base::WordOf(*bytes);
} catch (const ProtocolError&) {
    return std::nullopt;
}

std::string GdbTarget::WhereStopped() {
    const auto pc = ProgramCounter();
    return pc ? fmt::format(" at pc {:#x}", *pc) : "";
}

void GdbTarget::Read(void* buffer, std::size_t count, std::uint32_t address, int /*page*/,
                     std::size_t width) {
    const auto describe = [&] {
        return fmt::format("Reading {} x {} bytes at {:#x}", count, width, address);
    };
    Perform(describe, [&] {
        const std::size_t size = CheckedSize(count, address, width);
        if (size == 0) return;
        if (!crash_.empty() && InMailbox(address, size)) throw ProtocolError(crash_);
        const bool look = started_ && InMailbox(address, size);
        StopForAccess();
        const std::string bytes = look ? ReadMailbox(address, size) : Memory().Read(address, size);
        std::memcpy(buffer, bytes.data(), size);
        // Whoever has looked at something else, or has found the program busy, waits now.
        const bool waits = !look || bytes == base::WordBytes(mailbox_.busyWord);
        if (started_ && waits && core_.IsStopped()) GoOn();
    });
}

void GdbTarget::Write(const void* buffer, std::size_t count, std::uint32_t address, int /*page*/,
                      std::size_t width) {
    const auto describe = [&] {
        return fmt::format("Writing {} x {} bytes at {:#x}", count, width, address);
    };
    Perform(describe, [&] {
        const std::size_t size = CheckedSize(count, address, width);
        if (size == 0) return;
        StopForAccess();
        const std::string_view bytes(static_cast<const char*>(buffer), size);
        Memory().Write(address, bytes);
        if (mailboxBytes_ && InMailbox(address, size))
            mailboxBytes_->replace(address - mailbox_.address, size, bytes);
        else if (OverlapsMailbox(address, size))
            mailboxBytes_.reset();
    });
}

/// The core is stopped, or can be asked as it runs.
void GdbTarget::StopForAccess() {
    if (core_.RunsLive())
        core_.RequireRunning();
    else
        core_.Stop();
}

MemoryPort& GdbTarget::Memory() {
    return liveMemory_ && !core_.IsStopped() ? *liveMemory_ : memory_;
}

std::string GdbTarget::ReadMailbox(std::uint32_t address, std::size_t size) {
    if (!core_.IsStopped()) return Memory().Read(address, size);
    if (!mailboxBytes_) mailboxBytes_ = memory_.Read(mailbox_.address, mailbox_.sizeBytes);
    return mailboxBytes_->substr(address - mailbox_.address, size);
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

void GdbTarget::GoOn() {
    mailboxBytes_.reset();
    core_.Resume();
}

void GdbTarget::Run() {
    Perform([] { return std::string("Running the target"); },
            [&] {
                if (started_) throw ProtocolError("isn't asked: the target is running already");
                checksumProved_ = false;
                mailboxBytes_.reset();
                const bool tries = options_.live == GdbOptions::Live::Auto &&
                                   (profile_->triesLive || features_.nonStop);
                if (std::exchange(liveTried_, true) || !tries || core_.RunsLive())
                    core_.Resume();
                else
                    core_.TryLive(mailbox_.address, features_.nonStop);
                started_ = true;
                std::this_thread::sleep_for(kStartUp);
            });
}

void GdbTarget::Halt() {
    Perform([] { return std::string("Halting the target"); },
            [&] {
                crash_.clear();
                core_.Stop();
                started_ = false;
            });
}

// How a server resets is its own business; a reset ends a crash as well.
void GdbTarget::Reset(bool /*flag*/) {
    const std::string how = ResetText();
    const auto describe = [&] { return fmt::format("Resetting the target ({})", how); };
    Perform(describe, [&] {
        try {
            core_.Stop();
        } catch (const StoppedByItself&) {
            // Whatever it did, it doesn't do it any more.
        }
        started_ = false;
        checksumProved_ = false;
        crash_.clear();
        mailboxBytes_.reset();
        std::string output;
        if (how.starts_with(kPacket))
            ResetByPacket(how.substr(std::size(kPacket) - 1));
        else
            output = Monitor(how);
        core_.ForgetStops();
        RequireHalted(fmt::format("after \"{}\"{}", how, LastLines(output)));
    });
}

/// "vRun" is answered by a stop; "R" by nothing, so that the next answer shows whether it was
/// taken.
void GdbTarget::ResetByPacket(const std::string& packet) {
    const bool answered = packet == "vRun";
    if (!answered) connection_.Send("R00");
    const std::string request = answered ? "vRun;" : "?";
    const std::string reply = connection_.Ask(request);
    const auto stop = ParseStopReply(reply);
    if (!stop) connection_.Reject(request, reply);
    if (stop->kind == StopReply::Kind::Exited)
        throw ProtocolError("has no target any more after that");
}

void GdbTarget::Pause(std::chrono::nanoseconds time) {
    Perform([] { return std::string("Letting the target run"); },
            [&] {
                if (started_ && core_.IsStopped()) GoOn();
            });
    const auto end = std::chrono::steady_clock::now() + time;
    constexpr milliseconds kSlice(50);
    while (std::chrono::steady_clock::now() < end && !(interrupted_ && interrupted_()))
        std::this_thread::sleep_until(std::min(end, After(kSlice)));
}

void GdbTarget::Release(bool start) {
    if (connection_.IsLost()) return;
    Perform([] { return std::string("Leaving the target"); },
            [&] {
                // What "D" doesn't let run goes on as the connection is closed.
                const bool detaches = options_.detach && (!start || profile_->detachResumes);
                if (start && !detaches) {
                    if (core_.IsStopped()) core_.Resume();
                } else {
                    core_.Stop();
                    started_ = false;
                }
                try {
                    if (detaches) connection_.Ask("D");
                } catch (const ProtocolError&) {
                    // Some servers close the connection in place of a reply.
                }
                connection_.Close();
            });
}

}  // namespace target::gdb
