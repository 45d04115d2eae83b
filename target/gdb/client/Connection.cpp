// Sending, acknowledging, resending once, and giving a connection up.

#include "target/gdb/client/Connection.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

namespace target::gdb {

namespace {

using std::chrono::milliseconds;

// A server that only shows that it is alive, and never comes to an end, keeps nobody for longer
// than so many times the time that a reply may take.
constexpr int kOutputLimit = 12;

// For a server that is busy, or keeps a connection open whose other side is closed.
constexpr milliseconds kToRead(1000);

// As much of a command's output as anybody reads.
constexpr std::size_t kOutputMax = std::size_t{64} << 10;

bool AnsweredByStopReply(const std::string& request) {
    return request == "?" || request == "vStopped" || request.starts_with("vAttach;") ||
           request.starts_with("vRun;");
}

}  // namespace

std::string Shown(std::string_view payload) {
    constexpr std::size_t kShownMax = 48;
    std::string text;
    for (const char byte : payload.substr(0, kShownMax)) {
        if (byte >= ' ' && byte <= '~')
            text += byte;
        else
            text += fmt::format("\\x{:02x}", static_cast<unsigned char>(byte));
    }
    if (payload.size() > kShownMax) text += fmt::format("... ({} bytes)", payload.size());
    return text;
}

Connection::Connection(Socket socket, milliseconds timeout, PacketTrace trace)
    : socket_(std::move(socket)), timeout_(timeout), trace_(std::move(trace)) {}

std::string Connection::Ask(const std::string& request) {
    Send(request);
    Wait wait = Patience();
    return AwaitReply(request, wait);
}

std::string Connection::Ask(const std::string& request, milliseconds time) {
    Send(request);
    Wait wait = Patience(time);
    while (!packet_) {
        if (!Step(wait))
            Lose(fmt::format("sent no reply to \"{}\" {}", Shown(request), Within(time)));
    }
    return AwaitReply(request, wait);
}

std::string Connection::AwaitReply(const std::string& request, Wait& wait) {
    while (!packet_) {
        if (!Step(wait))
            Lose(fmt::format("sent no reply to \"{}\" {}", Shown(request), WithinTimeout()));
    }
    lastReply_ = *packet_;
    return *TakePacket();
}

void Connection::RequireOk(const std::string& request) {
    const std::string reply = Ask(request);
    if (reply != "OK") Reject(request, reply);
}

bool Connection::Agrees(const std::string& request) {
    const std::string reply = Ask(request);
    if (reply != "OK" && !IsRefusal(reply)) Reject(request, reply);
    return reply == "OK";
}

void Connection::Reject(const std::string& request, const std::string& reply) {
    const std::string why =
        fmt::format(R"(answered "{}" to "{}")", IsError(reply) ? ErrorText(reply) : Shown(reply),
                    Shown(request));
    if (!IsRefusal(reply)) Lose(why);
    throw ProtocolError(why);
}

void Connection::Send(const std::string& request) {
    TakeArrived();
    RefuseUnasked();
    if (trace_) trace_("->", Shown(request));
    output_.clear();
    damageSeen_ = false;
    stopExpected_ = AnsweredByStopReply(request);
    Deliver(request);
}

void Connection::Relay(const std::string& request) {
    if (IsLost()) throw ProtocolError(lost_);
    if (trace_) trace_("->", Shown(request));
    damageSeen_ = false;
    Deliver(request);
}

void Connection::Deliver(const std::string& request) {
    const std::string frame = Framed(request);
    Wait wait = Patience();
    ++sentCount_;
    // A packet that got no answer may have been acted upon, so it isn't sent again.
    for (int tries = 0; tries < 2; ++tries) {
        Write(frame);
        if (!acknowledged_ || AwaitAck(wait)) return;
    }
    Lose(fmt::format("refused \"{}\" twice as garbled", Shown(request)));
}

/// With nothing out there is no reply to come. The last one once more is no fault as long as
/// packets are acknowledged: the acknowledgement may have been garbled on its way.
void Connection::RefuseUnasked() {
    const auto unasked = TakePacket();
    if (!unasked || (acknowledged_ && *unasked == lastReply_)) return;
    Lose(fmt::format("sent \"{}\" without being asked; its replies can't be told apart any more",
                     Shown(*unasked)));
}

/// False when the packet was refused. A packet in front of the acknowledgement answers something
/// older: one that was sent twice, since an acknowledgement was garbled on its way.
bool Connection::AwaitAck(Wait& wait) {
    for (;;) {
        auto frame = NextFrame(wait.deadline);
        if (!frame) Lose("acknowledged no packet " + WithinTimeout());
        if (frame->kind == Frame::Kind::Ack) return true;
        if (frame->kind == Frame::Kind::Nak) return false;
        const bool expected = std::exchange(stopExpected_, false);
        Take(std::move(*frame), wait);
        stopExpected_ = expected;
        packet_.reset();
    }
}

void Connection::Interrupt() {
    if (IsLost()) throw ProtocolError(lost_);
    if (trace_) trace_("->", "interrupt");
    ++sentCount_;
    damageSeen_ = false;
    stopExpected_ = false;  // from here on a stop is an event, even a late answer to "?"
    Write(std::string_view(&kInterrupt, 1));
}

bool Connection::Step(Wait& wait) {
    if (IsLost()) throw ProtocolError(lost_);
    auto frame = NextFrame(wait.deadline);
    if (!frame) return false;
    Take(std::move(*frame), wait);
    return true;
}

void Connection::TakeArrived() {
    if (IsLost()) throw ProtocolError(lost_);
    // More than this only a server sends that never stops talking.
    constexpr int kPiecesMax = 64;
    for (int i = 0; i < kPiecesMax && FeedBefore({}); ++i) {
    }
    Wait past{};
    while (!packet_ && Step(past)) {
    }
}

Wait Connection::Patience(milliseconds time) const {
    return {After(time), After(kOutputLimit * time)};
}

std::string Connection::Within(milliseconds time) {
    return fmt::format("within {} s; --gdb-option timeout=TIME allows it more",
                       std::chrono::duration<double>(time).count());
}

// Closed at once, with something of the server's unread, the connection would break for a server
// that is busy, and the last request with it.
void Connection::Close() {
    try {
        socket_.EndWriting();
        const Deadline end = socket_.Until(After(kToRead));
        while (std::chrono::steady_clock::now() < end && !socket_.Read(end).empty()) {
        }
    } catch (const SocketError&) {
        // It has read all, and closed its side.
    }
    socket_.Close();
}

void Connection::Lose(const std::string& why) {
    if (lost_.empty()) lost_ = why;
    socket_.Close();
    throw ProtocolError(lost_);
}

std::optional<Frame> Connection::NextFrame(Deadline& deadline) {
    for (;;) {
        if (auto frame = decoder_.Next()) return frame;
        // A server that never stops talking keeps nobody either.
        deadline = socket_.Until(deadline);
        if (std::chrono::steady_clock::now() >= deadline || !FeedBefore(deadline))
            return std::nullopt;
    }
}

bool Connection::FeedBefore(Deadline deadline) {
    try {
        const std::string bytes = socket_.Read(deadline);
        decoder_.Feed(bytes);
        return !bytes.empty();
    } catch (const SocketError& error) {
        Lose(fmt::format("is gone: {}", error.what()));
    }
}

// Acknowledges what asks for it, and sorts it.
void Connection::Take(Frame frame, Wait& wait) {
    const bool packet = frame.kind == Frame::Kind::Packet;
    if (trace_ && (packet || frame.kind == Frame::Kind::Notification))
        trace_("<-", (packet ? "" : "%") + Shown(frame.payload));
    if (frame.kind == Frame::Kind::Damaged) {
        if (!acknowledged_ || damageSeen_) Lose(fmt::format("sent {}", frame.payload));
        damageSeen_ = true;
        Write("-");
    } else if (packet) {
        if (acknowledged_) Write("+");
        if (relay_) return relay_(frame);
        TakePayload(std::move(frame.payload), wait);
    } else if (relay_ && frame.kind == Frame::Kind::Notification) {
        relay_(frame);
    } else if (frame.kind == Frame::Kind::Notification && frame.payload.starts_with("Stop:")) {
        const auto stop = ParseStopReply(std::string_view(frame.payload).substr(5));
        if (stop && stopSink_) stopSink_(*stop);
    }
}

void Connection::TakePayload(std::string payload, Wait& wait) {
    const auto event = ParseStopReply(payload);
    if (event && event->kind == StopReply::Kind::Output) {
        if (output_.size() < kOutputMax) output_ += event->text;
        return Extend(wait);
    }
    if (event && !std::exchange(stopExpected_, false)) {
        if (stopSink_) stopSink_(*event);
        return;
    }
    packet_ = std::move(payload);
}

/// Not once the user has interrupted the work: then a server that goes on talking keeps nobody.
void Connection::Extend(Wait& wait) const {
    const Deadline later = std::min(After(timeout_), wait.limit);
    if (later > wait.deadline && socket_.Until(later) == later) wait.deadline = later;
}

void Connection::Write(std::string_view bytes) {
    try {
        socket_.Write(bytes, After(timeout_));
    } catch (const SocketError& error) {
        Lose(fmt::format("is gone: {}", error.what()));
    }
}

}  // namespace target::gdb
