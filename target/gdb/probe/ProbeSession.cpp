// The table of the requests that don't just pass, and one function for each.

#include "target/gdb/probe/ProbeSession.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

#include "base/Hex.h"
#include "target/gdb/server/Documents.h"
#include "target/gdb/server/SectionChecksum.h"
#include "target/gdb/wire/Fields.h"
#include "target/gdb/wire/Frame.h"

namespace target::gdb {

namespace {

constexpr char kDone[] = "OK";
constexpr char kFailed[] = "E01";

// What the server offers that the session can't have, and what it offers itself.
constexpr std::string_view kTakenOut[] = {"QNonStop", "QStartNoAckMode", "qXfer:memory-map:read"};
constexpr char kAdded[] = "QStartNoAckMode+;qXfer:memory-map:read+";

constexpr std::uint32_t kPieceMax = 0x1000;

bool Resumes(std::string_view payload) {
    constexpr std::string_view kResumes[] = {"vCont;", "vRun", "c", "C", "s", "S", "bc", "bs"};
    return std::ranges::any_of(kResumes, [&](auto name) { return payload.starts_with(name); });
}

bool AccessesMemory(std::string_view payload) {
    return payload.find_first_of("mMX") == 0;
}

base::AddressRange RangeOf(std::uint32_t address, std::size_t size) {
    const std::uint64_t last = std::uint64_t{address} + std::max<std::size_t>(size, 1) - 1;
    return {address, static_cast<std::uint32_t>(std::min<std::uint64_t>(last, 0xFFFFFFFF))};
}

/// "0,400,2;cond" as "0,400,2".
std::string BreakpointKey(std::string_view request) {
    return std::string(request.substr(1, request.find(';') - 1));
}

}  // namespace

/// Requests of its own, whose replies don't go to the debugger.
class ProbeSession::Own {
  public:
    explicit Own(ProbeSession& session) : session_(session) {
        ++session_.ownDepth_;
        session_.probe_.Wire().SetRelay({});
    }
    ~Own() {
        if (--session_.ownDepth_ != 0) return;
        session_.probe_.Wire().SetRelay(
            [&session = session_](const Frame& frame) { session.TakeFromProbe(frame); });
    }
    Own(const Own&) = delete;
    Own& operator=(const Own&) = delete;

  private:
    ProbeSession& session_;
};

struct ProbeSession::RequestRow {
    std::string_view name;
    ReadArguments read;
    Reply (ProbeSession::*answer)(const Arguments& arguments);
};

const ProbeSession::RequestRow* ProbeSession::FindRow(std::string_view payload) {
    static constexpr RequestRow kRows[] = {
        {"QStartNoAckMode", Nothing, &ProbeSession::StartNoAckMode},
        {"QNonStop:", Anything, &ProbeSession::Refuse},
        {"qXfer:memory-map:read::", Range, &ProbeSession::ReadMemoryMap},
        {"vFlashErase:", Range, &ProbeSession::EraseFlash},
        {"vFlashWrite:", FlashBytes, &ProbeSession::WriteFlash},
        {"vFlashDone", Nothing, &ProbeSession::FlashDone},
        {"qCRC:", Range, &ProbeSession::Checksum},
        {"qRcmd,", HexData, &ProbeSession::Monitor},
        {"m", Range, &ProbeSession::ReadMemory},
        {"x", Range, &ProbeSession::ReadBinary},
        {"M", HexBytes, &ProbeSession::WriteMemory},
        {"X", BinaryBytes, &ProbeSession::WriteMemory},
    };
    for (const RequestRow& row : kRows)
        if (payload.starts_with(row.name)) return &row;
    return nullptr;
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

ProbeSession::Reply ProbeSession::Answer(const std::string& payload) {
    const RequestRow* row = FindRow(payload);
    Arguments arguments;
    // What can't be understood is for the probe to refuse, but for what it never offered.
    if (row == nullptr) return std::nullopt;
    if (!row->read(std::string_view(payload).substr(row->name.size()), arguments))
        return row->name.starts_with("vFlash") ? Reply(kFailed) : std::nullopt;
    return (this->*row->answer)(arguments);
}

// --- From the probe

void ProbeSession::TakeFromProbe(const Frame& frame) {
    if (frame.kind == Frame::Kind::Notification) return client_.Notify(Escaped(frame.payload));
    const auto stop = ParseStopReply(frame.payload);
    if (stop && stop->kind == StopReply::Kind::Output) return client_.Send(Escaped(frame.payload));
    const bool answersResume =
        std::exchange(running_, running_ && !stop && !IsRefusal(frame.payload));
    stopped_ = stop ? stop->kind == StopReply::Kind::Stopped : stopped_ && !answersResume;
    std::string reply = frame.payload;
    if (asked_ && asked_->starts_with("qSupported") && !IsError(reply)) reply = WithFlash(reply);
    NoteReply(reply);
    client_.Send(Escaped(reply));
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

// --- Requests

ProbeSession::Reply ProbeSession::StartNoAckMode(const Arguments&) {
    return kDone;
}

ProbeSession::Reply ProbeSession::Refuse(const Arguments&) {
    return "";
}

// All but the flash is memory of some kind: a debugger refuses addresses that no region has.
ProbeSession::Reply ProbeSession::ReadMemoryMap(const Arguments& arguments) {
    const MemoryRegion flash = Flash().Flash();
    const std::string document = MemoryDocument(
        {flash, {flash.address + flash.sizeBytes, 0U - (flash.address + flash.sizeBytes), 0}});
    return DocumentReply(document, arguments, features_.packetSize);
}

ProbeSession::Reply ProbeSession::EraseFlash(const Arguments& arguments) {
    FlashProgrammer& flash = Flash();
    const Own own(*this);
    flash.Erase(arguments.address, arguments.length);
    return kDone;
}

ProbeSession::Reply ProbeSession::WriteFlash(const Arguments& arguments) {
    FlashProgrammer& flash = Flash();
    const Own own(*this);
    flash.Write(arguments.address, arguments.data);
    if (!flash.HasWork()) return kDone;
    Borrow();
    flash.Work(stop_);
    return kDone;
}

ProbeSession::Reply ProbeSession::FlashDone(const Arguments&) {
    FlashProgrammer& flash = Flash();
    const Own own(*this);
    Borrow();
    flash.Done(stop_);
    GiveBack();
    return kDone;
}

bool ProbeSession::TouchesCollected(const Arguments& arguments) const {
    return flash_ && flash_->Touches(RangeOf(arguments.address, arguments.length));
}

bool ProbeSession::TouchesOwn(const Arguments& arguments) const {
    return TouchesCollected(arguments) ||
           (saved_ && saved_->Touches(RangeOf(arguments.address, arguments.length)));
}

std::string ProbeSession::ReadThrough(std::uint32_t address, std::uint32_t size) {
    std::string bytes(size, '\0');
    const Own own(*this);
    probe_.Read(bytes.data(), bytes.size(), address, 0, 1);
    if (flash_) flash_->Overlay(address, bytes);
    if (saved_) saved_->Overlay(address, bytes);
    return bytes;
}

ProbeSession::Reply ProbeSession::ReadMemory(const Arguments& arguments) {
    if (arguments.length == 0 || !TouchesOwn(arguments)) return std::nullopt;
    Settle();
    return base::ToHex(ReadThrough(arguments.address, std::min(arguments.length, kPieceMax)));
}

ProbeSession::Reply ProbeSession::ReadBinary(const Arguments& arguments) {
    if (TouchesOwn(arguments)) return "";
    return std::nullopt;
}

ProbeSession::Reply ProbeSession::WriteMemory(const Arguments& arguments) {
    if (arguments.length == 0 || !TouchesOwn(arguments)) return std::nullopt;
    if (TouchesCollected(arguments))
        throw TargetError(
            fmt::format("writing {} bytes at {:#x}: a debugger writes flash by its "
                        "load command",
                        arguments.length, arguments.address));
    Settle();
    saved_->Write(arguments.address, arguments.data);
    if (saved_->Holds(RangeOf(arguments.address, arguments.length))) return kDone;
    // Partly beside what is saved. What is there gets it with the rest, when that is put back.
    const Own own(*this);
    std::string bytes = arguments.data;
    probe_.Write(bytes.data(), bytes.size(), arguments.address, 0, 1);
    return kDone;
}

ProbeSession::Reply ProbeSession::Checksum(const Arguments& arguments) {
    if (arguments.length == 0 || !TouchesOwn(arguments)) return std::nullopt;
    Settle();
    return SectionChecksum(
        arguments.address, arguments.length,
        [this](std::uint32_t address, std::uint32_t size) { return ReadThrough(address, size); });
}

ProbeSession::Reply ProbeSession::Monitor(const Arguments& arguments) {
    if (arguments.data != "corvane") return std::nullopt;
    client_.Send("O" + base::ToHex(flash_ ? flash_->Report()
                                          : "No flash was asked for since you connected\n"));
    return kDone;
}

}  // namespace target::gdb
