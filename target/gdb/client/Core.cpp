// Starting and stopping a core, and reading what stopped it.

#include "target/gdb/client/Core.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

#include "base/Hex.h"

namespace target::gdb {

namespace {

using std::chrono::milliseconds;

// A server that could answer at once gets no longer than this where silence means something.
constexpr milliseconds kSilence(1000);

constexpr unsigned kNoSignal = 0;

// Servers call the stop that was asked for an interrupt, a trap, a stop, or nothing at all.
bool MayBeAskedFor(unsigned signal) {
    constexpr unsigned kInterrupted = 2;
    constexpr unsigned kTrap = 5;
    constexpr unsigned kStop = 17;
    return signal == kNoSignal || signal == kInterrupted || signal == kTrap || signal == kStop;
}

}  // namespace

void Core::Attach() {
    connection_.Send("?");
    const auto state = connection_.Receive(std::min(connection_.Timeout(), kSilence));
    const auto reply = state ? ParseStopReply(*state) : std::nullopt;
    if (reply && reply->kind == StopReply::Kind::Exited)
        throw ProtocolError(fmt::format(
            "has no running target (\"{}\"); it may have to be told to attach to one", *state));
    if (state && !reply) throw ProtocolError(fmt::format(R"(answered "{}" to "?")", Shown(*state)));
    if (reply && reply->signal != kNoSignal) return;
    // No reply, or a stop without a cause: the target probably runs. One that is stopped already
    // may not answer.
    connection_.Interrupt();
    if (!state)
        AwaitStop(connection_.Timeout());
    else
        connection_.Receive(std::min(connection_.Timeout(), kSilence));
}

void Core::Resume() {
    if (nonStop_) {
        connection_.RequireOk("vCont;c");
    } else {
        if (!asked_ && OffersContinue(connection_.Ask("vCont?"))) continue_ = "vCont;c";
        asked_ = true;
        connection_.Send(continue_);
    }
    running_ = true;
}

void Core::Stop() {
    if (!running_) return;
    RequireRunning();
    if (!nonStop_) connection_.Interrupt();
    const StopReply reply = nonStop_ ? StopNonStop() : AwaitStop(connection_.Timeout());
    running_ = false;
    if (reply.kind != StopReply::Kind::Stopped || !MayBeAskedFor(reply.signal)) FailStopped(reply);
}

void Core::RequireRunning() {
    connection_.TakeArrived();
    Deadline past{};
    const auto news =
        nonStop_ ? connection_.ReceiveNotification("Stop", past) : connection_.Receive(past);
    if (!news) return;
    const auto reply = ParseStopReply(*news);
    if (reply && reply->kind == StopReply::Kind::Output) return;
    running_ = false;
    if (nonStop_) DrainStops();
    if (!reply) throw ProtocolError(fmt::format("sent \"{}\" while the target ran", Shown(*news)));
    FailStopped(*reply);
}

StopReply Core::AwaitStop(milliseconds timeout) {
    Deadline deadline = After(timeout);
    while (const auto packet = connection_.Receive(deadline)) {
        auto reply = ParseStopReply(*packet);
        if (!reply)
            connection_.Lose(fmt::format("answered \"{}\" to an interrupt", Shown(*packet)));
        if (reply->kind != StopReply::Kind::Output) return *reply;
    }
    connection_.Lose(fmt::format("didn't stop the target within {} s",
                                 std::chrono::duration<double>(timeout).count()));
}

StopReply Core::StopNonStop() {
    constexpr char kStop[] = "vCont;t";
    connection_.Send(kStop);
    Deadline deadline = After(connection_.Timeout());
    std::string reply = connection_.AwaitReply(kStop, deadline);
    if (std::exchange(lookPending_, false) && reply != "OK")
        reply = connection_.AwaitReply(kStop, deadline);
    // Whatever was answered, the target isn't known to have stopped.
    if (reply != "OK")
        connection_.Lose(fmt::format(R"(answered "{}" to "{}")", Shown(reply), kStop));
    const auto stop = connection_.ReceiveNotification("Stop", deadline);
    const auto parsed = stop ? ParseStopReply(*stop) : std::nullopt;
    if (!parsed) connection_.Lose("didn't stop the target in time");
    DrainStops();
    return *parsed;
}

// A notification stands for a list of stops, and there is a next one only when it has been read.
void Core::DrainStops() {
    constexpr int kThreadsMax = 64;
    for (int i = 0; i < kThreadsMax; ++i) {
        if (!ParseStopReply(connection_.Ask("vStopped"))) return;
    }
}

void Core::TryLive(std::uint32_t address) {
    if (!connection_.Agrees("QNonStop:1")) return;
    nonStop_ = true;
    try {
        Resume();
        live_ = ReadsWhileRunning(address);
        if (live_) return;
        Stop();
    } catch (const StoppedByItself&) {
        throw;
    } catch (const ProtocolError&) {
        if (connection_.IsLost()) throw;
    }
    nonStop_ = false;
    running_ = false;
    connection_.Ask("QNonStop:0");
}

bool Core::ReadsWhileRunning(std::uint32_t address) {
    connection_.Send(fmt::format("m{:x},4", address));
    const auto reply = connection_.Receive(std::min(connection_.Timeout(), kSilence));
    lookPending_ = !reply || ParseStopReply(*reply);
    const auto bytes = reply ? base::FromHex(*reply) : std::nullopt;
    return bytes && bytes->size() == 4;
}

void Core::FailStopped(const StopReply& reply) {
    if (reply.kind == StopReply::Kind::Exited)
        throw StoppedByItself("says that the program on the target has ended");
    throw StoppedByItself(fmt::format("says that the program on the target stopped by itself: {}",
                                      SignalName(reply.signal)));
}

}  // namespace target::gdb
