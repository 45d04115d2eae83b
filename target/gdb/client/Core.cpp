// Starting and stopping a core, and making sense of what its server says about that.

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

// The same where it holds up the work: a trial, and a program that has probably stopped.
constexpr milliseconds kShortSilence(400);

constexpr unsigned kNoSignal = 0;
constexpr unsigned kInterruptSignal = 2;
constexpr unsigned kTrap = 5;
constexpr unsigned kStop = 17;

constexpr char kHalt[] = "vCont;t";

bool NamesAnInterrupt(unsigned signal) {
    return signal == kNoSignal || signal == kInterruptSignal || signal == kStop;
}

}  // namespace

Core::Core(Connection& connection) : connection_(connection) {
    connection_.SetStopSink([this](const StopReply& stop) { Take(stop); });
}

/// All stop events, and nothing else changes Running or Live to Stopped but a refused resume.
void Core::Take(const StopReply& stop) {
    notified_ = nonStop_;
    if (state_ == State::Stopped) return;
    const bool answer = MayBeAnswer(stop);
    if (!answer && IsEcho(stop)) {
        echoTaken_ = true;
        doubtful_ = stop;
        return;
    }
    if (!answer) crash_ = stop;
    if (answer && interruptOut_) usual_ = stop.signal;
    last_ = stop.signal;
    interruptedLast_ = interruptOut_;
    Enter(State::Stopped);
}

/// Servers call the stop that was asked for an interrupt, a stop, nothing at all, or a trap, each
/// always the same: where it used to be an interrupt, a trap is the program's own.
bool Core::MayBeAnswer(const StopReply& stop) const {
    if (stop.kind != StopReply::Kind::Stopped || (!interruptOut_ && !trying_)) return false;
    if (NamesAnInterrupt(stop.signal)) return true;
    return stop.signal == kTrap && interruptOut_ && usual_.value_or(kTrap) == kTrap;
}

bool Core::IsEcho(const StopReply& stop) const {
    if (stop.kind != StopReply::Kind::Stopped || echoTaken_ || interruptOut_) return false;
    if (NamesAnInterrupt(stop.signal) && interruptedLast_) return true;
    return stop.signal == last_ && (NamesAnInterrupt(stop.signal) || stop.signal == kTrap);
}

void Core::Enter(State state) {
    const auto now = Clock::now();
    // What an interrupt stops has run until that was sent, and was counted then.
    if (state == State::Stopped && RunsUninterrupted()) ran_ += now - since_;
    if (state_ == State::Stopped) since_ = now;
    state_ = state;
    echoTaken_ = false;
    interruptOut_ = false;
    doubtful_.reset();
}

std::chrono::nanoseconds Core::RanFor() const {
    return RunsUninterrupted() ? ran_ + (Clock::now() - since_) : ran_;
}

void Core::Attach() {
    connection_.Send("?");
    Wait wait = connection_.Patience(std::min(connection_.Timeout(), kSilence));
    std::optional<std::string> reply;
    while (!reply && connection_.Step(wait))
        reply = connection_.TakePacket();
    const auto stop = reply ? ParseStopReply(*reply) : std::nullopt;
    if (reply && !stop) connection_.Reject("?", *reply);
    if (!stop || stop->signal == kNoSignal) {
        // The target probably runs, and stops only now; one that is stopped already may not answer.
        Enter(State::Running);
        Interrupt();
        Wait patience = stop ? connection_.Patience(std::min(connection_.Timeout(), kSilence))
                             : connection_.Patience();
        if (!AwaitStopped(patience) && !stop)
            connection_.Lose("didn't stop the target " + connection_.WithinTimeout());
        Enter(State::Stopped);
    }
    const auto told = crash_ ? crash_ : stop;
    if (told && told->kind == StopReply::Kind::Exited)
        throw ProtocolError(
            fmt::format("has no running target (\"{}\"); it may have to be told to attach to one",
                        reply ? Shown(*reply) : "W"));
    if (stop && !last_) last_ = stop->signal;
    crash_.reset();  // what stopped it before is no concern of ours
}

void Core::Resume() {
    connection_.TakeArrived();
    if (notified_) DrainNotifications();
    SendResume();
    Enter(live_ ? State::Live : State::Running);
}

void Core::SendResume() {
    if (nonStop_) return connection_.RequireOk("vCont;c");
    if (continue_.empty()) {
        const std::string reply = connection_.Ask("vCont?");
        if (!IsRefusal(reply) && !reply.starts_with("vCont")) connection_.Reject("vCont?", reply);
        continue_ = OffersContinue(reply) ? "vCont;c" : "c";
    }
    connection_.Send(continue_);
}

void Core::Stop() {
    ThrowCrash();
    if (state_ == State::Stopped) return;
    CatchUp();
    ThrowCrash();
    Interrupt();
    Wait wait = connection_.Patience();
    if (doubtful_) wait = connection_.Patience(std::min(connection_.Timeout(), kShortSilence));
    if (!AwaitStopped(wait)) {
        if (!doubtful_) connection_.Lose("didn't stop the target " + connection_.WithinTimeout());
        crash_ = doubtful_;
        Enter(State::Stopped);
    }
    if (nonStop_) DrainNotifications();
    ThrowCrash();
}

void Core::ForgetStops() {
    connection_.TakeArrived();
    if (notified_) DrainNotifications();
    crash_.reset();
}

void Core::RequireRunning() {
    ThrowCrash();
    if (state_ == State::Stopped) return;
    CatchUp();
    if (notified_ && state_ == State::Stopped) DrainNotifications();
    ThrowCrash();
    if (!doubtful_) return;
    Stop();
    Resume();
}

/// Takes in what has arrived. The only packet that can be there is the refusal of the resume.
void Core::CatchUp() {
    connection_.TakeArrived();
    RefusePacket(continue_);
}

void Core::RefusePacket(const std::string& request) {
    const auto packet = connection_.TakePacket();
    if (!packet) return;
    Enter(State::Stopped);
    connection_.Reject(request, *packet);
}

void Core::Interrupt() {
    ran_ += Clock::now() - since_;
    interruptOut_ = true;
    if (!nonStop_) return connection_.Interrupt();
    connection_.Send(kHalt);
    Wait wait = connection_.Patience();
    std::string reply = connection_.AwaitReply(kHalt, wait);
    if (std::exchange(readOut_, false) && reply != "OK")
        reply = connection_.AwaitReply(kHalt, wait);
    // Whatever was answered, the target isn't known to have stopped.
    if (reply != "OK")
        connection_.Lose(fmt::format(R"(answered "{}" to "{}")", Shown(reply), kHalt));
}

/// Whether the stop was told before the deadline.
bool Core::AwaitStopped(Wait& wait) {
    while (state_ != State::Stopped) {
        if (!connection_.Step(wait)) return false;
        const auto packet = connection_.TakePacket();
        if (packet && !std::exchange(readOut_, false))
            connection_.Lose(fmt::format("answered \"{}\" to an interrupt", Shown(*packet)));
    }
    return true;
}

// A notification stands for a list of stops, and there is a next one only when it has been read.
void Core::DrainNotifications() {
    constexpr int kThreadsMax = 64;
    notified_ = false;
    for (int i = 0; i < kThreadsMax; ++i) {
        const std::string reply = connection_.Ask("vStopped");
        if (reply == "OK" || IsRefusal(reply)) return;
        if (!ParseStopReply(reply)) connection_.Reject("vStopped", reply);
    }
}

void Core::ThrowCrash() {
    const auto crash = std::exchange(crash_, std::nullopt);
    if (!crash) return;
    if (crash->kind == StopReply::Kind::Exited)
        throw StoppedByItself("says that the program on the target has ended");
    throw StoppedByItself(fmt::format("says that the program on the target stopped by itself: {}",
                                      SignalName(crash->signal)));
}

void Core::TryLive(std::uint32_t address, bool nonStopOffered) {
    if (nonStopOffered && TryNonStop(address)) return;
    Resume();
    // A server that doesn't listen as the program runs wouldn't acknowledge the request either.
    if (!nonStopOffered && !connection_.Acknowledges()) TryAllStop(address);
}

bool Core::TryNonStop(std::uint32_t address) {
    if (!connection_.Agrees("QNonStop:1")) return false;
    nonStop_ = true;
    try {
        Resume();
        if (ReadsAsItRuns(address)) return true;
        Stop();
    } catch (const StoppedByItself&) {
        throw;
    } catch (const ProtocolError&) {
        if (connection_.IsLost()) throw;
    }
    nonStop_ = notified_ = false;
    if (state_ != State::Stopped) Enter(State::Stopped);
    connection_.RequireOk("QNonStop:0");
    return false;
}

/// In all-stop mode the server may answer, refuse, stop the program (some do at any byte), keep the
/// request until the program stops, or drop it.
void Core::TryAllStop(std::uint32_t address) {
    trying_ = true;
    const bool reads = ReadsAsItRuns(address);
    trying_ = false;
    ThrowCrash();
    if (reads) return;
    if (readOut_) {
        Stop();
        // The read is answered before this, or never.
        connection_.Send("?");
        Wait wait = connection_.Patience();
        std::string reply = connection_.AwaitReply("?", wait);
        if (std::exchange(readOut_, false) && !ParseStopReply(reply))
            reply = connection_.AwaitReply("?", wait);
        if (!ParseStopReply(reply)) connection_.Reject("?", reply);
    }
    if (state_ == State::Stopped) Resume();
}

bool Core::ReadsAsItRuns(std::uint32_t address) {
    const std::string request = fmt::format("m{:x},4", address);
    connection_.Send(request);
    Wait wait = connection_.Patience(std::min(connection_.Timeout(), kShortSilence));
    std::optional<std::string> reply;
    while (!reply && state_ != State::Stopped && connection_.Step(wait))
        reply = connection_.TakePacket();
    readOut_ = !reply;
    if (!reply || IsRefusal(*reply)) return false;
    const auto bytes = base::FromHex(*reply);
    if (!bytes || bytes->size() != 4) connection_.Reject(request, *reply);
    live_ = state_ != State::Stopped;
    if (live_) state_ = State::Live;
    return live_;
}

}  // namespace target::gdb
