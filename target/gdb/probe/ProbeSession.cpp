// What passes, both ways, and what is asked in between.

#include "target/gdb/probe/ProbeSession.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

#include "target/gdb/wire/Fields.h"
#include "target/gdb/wire/Frame.h"

namespace target::gdb {

namespace {

// What the server offers that the session can't have, and what it offers itself.
constexpr std::string_view kTakenOut[] = {"QNonStop", "QStartNoAckMode", "qXfer:memory-map:read"};
constexpr char kAdded[] = "QStartNoAckMode+;qXfer:memory-map:read+";

bool Resumes(std::string_view payload) {
    constexpr std::string_view kResumes[] = {"vCont;", "vRun", "c", "C", "s", "S", "bc", "bs"};
    return std::ranges::any_of(kResumes, [&](auto name) { return payload.starts_with(name); });
}

bool AccessesMemory(std::string_view payload) {
    return payload.find_first_of("mMX") == 0;
}

/// "0,400,2;cond" as "0,400,2".
std::string BreakpointKey(std::string_view request) {
    return std::string(request.substr(1, request.find(';') - 1));
}

}  // namespace

ProbeSession::Own::Own(ProbeSession& session) : session_(session) {
    ++session_.ownDepth_;
    session_.probe_.Wire().SetRelay({});
}

ProbeSession::Own::~Own() {
    if (--session_.ownDepth_ != 0) return;
    session_.probe_.Wire().SetRelay(
        [&session = session_](const Frame& frame) { session.TakeFromProbe(frame); });
}

ProbeSession::ProbeSession(ClientPort& client, GdbTarget& probe, const OpenFlash& open,
                           const ComplaintSink& complain)
    : client_(client), probe_(probe), open_(open), complain_(complain), stop_([this] {
          return client_.IsInterrupted();
      }) {
    const Own relayFromNowOn(*this);
}

ProbeSession::~ProbeSession() {
    probe_.Wire().SetRelay({});
}

void ProbeSession::Take(const Frame& frame) {
    // Nothing else can be meant than a running program: nobody is here while flash is worked on.
    if (frame.kind == Frame::Kind::Interrupt) return probe_.Wire().Interrupt();
    Reply reply;
    try {
        reply = Answer(frame.payload);
        if (!reply) return Pass(frame.payload);
    } catch (const TargetError& error) {
        complain_(error.what());
        reply = kFailed;
    }
    client_.Send(*reply);
    if (frame.payload == "QStartNoAckMode") client_.StopAcknowledging();
}

// --- From the probe

void ProbeSession::TakeFromProbe(const Frame& frame) {
    if (frame.kind == Frame::Kind::Notification) return client_.Notify(Escaped(frame.payload));
    const auto stop = ParseStopReply(frame.payload);
    if (stop && stop->kind == StopReply::Kind::Output) return client_.Send(Escaped(frame.payload));
    if (stop && IsUnasked()) {
        stopped_ = stop->kind == StopReply::Kind::Stopped;
        return;
    }
    const bool answersResume =
        std::exchange(running_, running_ && !stop && !IsRefusal(frame.payload));
    stopped_ = stop ? stop->kind == StopReply::Kind::Stopped : stopped_ && !answersResume;
    std::string reply = frame.payload;
    if (asked_ && asked_->starts_with("qSupported") && !IsError(reply)) reply = WithFlash(reply);
    NoteReply(reply);
    client_.Send(Escaped(reply));
}

// A server that stops its target for whoever connects may tell that at once, which a debugger would
// take for the answer to its first request, and all other answers for those to the one before.
bool ProbeSession::IsUnasked() const {
    return !running_ && (!asked_ || asked_->starts_with("qSupported"));
}

void ProbeSession::NoteReply(const std::string& reply) {
    const std::string asked = std::exchange(asked_, std::nullopt).value_or("");
    if (reply != kDone || asked.size() < 2) return;
    if (asked[0] == 'Z') requests_.breakpoints[BreakpointKey(asked)] = asked;
    if (asked[0] == 'z') requests_.breakpoints.erase(BreakpointKey(asked));
    if (asked[0] == 'H') requests_.threads[asked[1]] = asked;
}

std::string ProbeSession::WithFlash(const std::string& features) {
    features_ = ParseFeatures(features);
    features_.nonStop = false;
    acknowledgesInVain_ = features_.noAckMode && probe_.Wire().Acknowledges();
    std::string text;
    for (std::string_view rest = features; !rest.empty();) {
        const std::string_view feature = TakeUntil(rest, ';');
        const bool out = std::ranges::any_of(
            kTakenOut, [&](std::string_view name) { return feature.starts_with(name); });
        if (!out && !feature.empty()) text += std::string(feature) + ";";
    }
    return text + kAdded;
}

// --- To the probe

void ProbeSession::Pass(const std::string& payload) {
    if (std::exchange(acknowledgesInVain_, false)) {
        const Own own(*this);
        if (probe_.Wire().Agrees("QStartNoAckMode")) probe_.Wire().StopAcknowledging();
    }
    // Memory beside what is saved is the debugger's all the time.
    if (payload.empty()) return client_.Send("");
    if (saved_ && !AccessesMemory(payload)) {
        Settle();
        GiveBack();
    }
    if (Resumes(payload)) {
        running_ = true;
        stopped_ = false;
    }
    ends_ = payload[0] == 'D' || payload == "k" || payload.starts_with("vKill");
    asked_ = payload;
    probe_.Wire().Relay(Escaped(payload));
}

void ProbeSession::Settle() {
    if (running_) throw TargetError("the target is running; stop it first");
    Wait wait = probe_.Wire().Patience();
    while (asked_ && probe_.Wire().Step(wait)) {
    }
    if (asked_)
        throw TargetError(fmt::format("the GDB server owes an answer to \"{}\"", Shown(*asked_)));
}

FlashProgrammer& ProbeSession::Flash() {
    Settle();
    if (!flash_) {
        const Own own(*this);
        probe_.Join(features_, stopped_);
        stopped_ = true;
        flash_ = open_(probe_);
    }
    return *flash_;
}

void ProbeSession::Borrow() {
    if (saved_) return;
    const Own own(*this);
    saved_.emplace(probe_, flash_->Scratch(), requests_);
}

void ProbeSession::GiveBack() {
    if (!saved_) return;
    const Own own(*this);
    SavedTarget saved = std::move(*saved_);
    saved_.reset();
    saved.PutBack();
}

void ProbeSession::Leave() {
    try {
        if (!probe_.IsConnected()) saved_.reset();
        GiveBack();
    } catch (const TargetError& error) {
        complain_(error.what());
    }
    const std::string text = flash_ ? flash_->Abandon() : "";
    if (!text.empty()) complain_(text);
}

}  // namespace target::gdb
