// Sending, acknowledging, resending once, and giving a connection up.

#include "target/gdb/client/Connection.h"

#include <fmt/format.h>

#include <utility>

#include "target/gdb/wire/Replies.h"

namespace target::gdb {

namespace {

using std::chrono::milliseconds;

bool IsStopReply(const std::string& packet) {
    const auto reply = ParseStopReply(packet);
    return reply && reply->kind == StopReply::Kind::Stopped;
}

bool IsOutput(const std::string& packet) {
    const auto reply = ParseStopReply(packet);
    return reply && reply->kind == StopReply::Kind::Output;
}

bool AnsweredByStopReply(const std::string& request) {
    return request == "?" || request == "c" || request == "vCont;c" || request == "vStopped" ||
           request.starts_with("vAttach;");
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
    Deadline deadline = After(timeout_);
    return AwaitReply(request, deadline);
}

std::string Connection::AwaitReply(const std::string& request, Deadline& deadline) {
    const bool outputExpected = request.starts_with("qRcmd,");
    for (;;) {
        const auto reply = Receive(deadline);
        if (!reply)
            Lose(fmt::format("sent no reply to \"{}\" within {} s", Shown(request),
                             std::chrono::duration<double>(timeout_).count()));
        if (!outputExpected && IsOutput(*reply)) continue;
        // An interrupt may have crossed a stop, which is then told twice.
        if (stopExpected_ || !IsStopReply(*reply)) return *reply;
    }
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
    const std::string why = fmt::format(R"(answered "{}" to "{}")", Shown(reply), Shown(request));
    if (!IsRefusal(reply)) Lose(why);
    throw ProtocolError(why);
}

void Connection::Send(const std::string& request) {
    if (IsLost()) throw ProtocolError(lost_);
    if (trace_) trace_("->", Shown(request));
    packet_.reset();
    damageSeen_ = false;
    stopExpected_ = AnsweredByStopReply(request);
    const std::string frame = Framed(request);
    Deadline deadline = After(timeout_);
    ++sentCount_;
    // A packet that got no answer may have been acted upon, so it isn't sent again.
    for (int tries = 0; tries < 2; ++tries) {
        Write(frame);
        if (!acknowledged_ || AwaitAck(deadline)) return;
    }
    Lose(fmt::format("refused \"{}\" twice as garbled", Shown(request)));
}

/// False when the packet was refused. A packet in front of the acknowledgement answers something
/// older: one that was sent twice, since an acknowledgement was garbled on its way.
bool Connection::AwaitAck(Deadline& deadline) {
    for (;;) {
        auto frame = NextFrame(deadline);
        if (!frame) Lose("acknowledged no packet in time");
        if (frame->kind == Frame::Kind::Ack) return true;
        if (frame->kind == Frame::Kind::Nak) return false;
        Take(std::move(*frame));
        packet_.reset();
    }
}

void Connection::Interrupt() {
    if (IsLost()) throw ProtocolError(lost_);
    if (trace_) trace_("->", "interrupt");
    ++sentCount_;
    damageSeen_ = false;
    Write(std::string_view(&kInterrupt, 1));
}

void Connection::TakeArrived() {
    if (IsLost()) throw ProtocolError(lost_);
    FeedBefore({});
}

std::optional<std::string> Connection::Receive(milliseconds timeout) {
    Deadline deadline = After(timeout);
    return Receive(deadline);
}

std::optional<std::string> Connection::Receive(Deadline& deadline) {
    if (IsLost()) throw ProtocolError(lost_);
    while (!packet_) {
        auto frame = NextFrame(deadline);
        if (!frame) return std::nullopt;
        Take(std::move(*frame));
    }
    return std::exchange(packet_, std::nullopt);
}

std::optional<std::string> Connection::ReceiveNotification(const std::string& name,
                                                           Deadline& deadline) {
    if (IsLost()) throw ProtocolError(lost_);
    for (;;) {
        while (!notification_) {
            auto frame = NextFrame(deadline);
            if (!frame) return std::nullopt;
            Take(std::move(*frame));
        }
        const std::string text = *std::exchange(notification_, std::nullopt);
        if (text.starts_with(name + ":")) return text.substr(name.size() + 1);
    }
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

// Acknowledges what asks for it, and keeps what somebody will ask for.
void Connection::Take(Frame frame) {
    const bool packet = frame.kind == Frame::Kind::Packet;
    if (trace_ && (packet || frame.kind == Frame::Kind::Notification))
        trace_("<-", (packet ? "" : "%") + Shown(frame.payload));
    if (frame.kind == Frame::Kind::Damaged) {
        if (!acknowledged_ || damageSeen_) Lose(fmt::format("sent {}", frame.payload));
        damageSeen_ = true;
        Write("-");
    } else if (packet) {
        if (acknowledged_) Write("+");
        packet_ = std::move(frame.payload);
    } else if (frame.kind == Frame::Kind::Notification) {
        notification_ = std::move(frame.payload);
    }
}

void Connection::Write(std::string_view bytes) {
    try {
        socket_.Write(bytes, After(timeout_));
    } catch (const SocketError& error) {
        Lose(fmt::format("is gone: {}", error.what()));
    }
}

}  // namespace target::gdb
