// From frames to requests, and from answers to frames.

#include "target/gdb/server/ClientPort.h"

#include <chrono>
#include <utility>

namespace target::gdb {

namespace {

constexpr std::chrono::milliseconds kToTakeAReply(10000);

// More is kept only of a single answer.
constexpr std::size_t kKeptMax = std::size_t{64} << 10;

}  // namespace

ClientPort::ClientPort(Reception::Client client) : socket_(std::move(client.socket)) {
    decoder_.Feed(client.said);
}

std::optional<Frame> ClientPort::Next() {
    std::optional<Frame> frame;
    if (waiting_.empty()) {
        frame = NextArrived();
    } else {
        frame = std::move(waiting_.front());
        waiting_.pop_front();
    }
    if (frame && frame->kind == Frame::Kind::Packet) last_.clear();
    return frame;
}

std::optional<Frame> ClientPort::NextArrived() {
    while (auto frame = decoder_.Next()) {
        switch (frame->kind) {
            case Frame::Kind::Packet:
                if (acknowledges_) Write("+");
                return frame;
            case Frame::Kind::Interrupt:
                return frame;
            case Frame::Kind::Damaged:
                if (acknowledges_) Write("-");
                break;
            case Frame::Kind::Nak:
                Write(last_);
                break;
            case Frame::Kind::Ack:
            case Frame::Kind::Notification:
                break;
        }
    }
    return std::nullopt;
}

bool ClientPort::IsInterrupted() try {
    Read();
    bool interrupted = false;
    while (auto frame = NextArrived()) {
        if (frame->kind == Frame::Kind::Interrupt)
            interrupted = true;
        else
            waiting_.push_back(std::move(*frame));
    }
    return interrupted;
} catch (const SocketError&) {
    return true;
}

void ClientPort::Send(std::string_view payload) {
    const std::string frame = Framed(payload);
    if (last_.size() + frame.size() > kKeptMax) last_.clear();
    last_ += frame;
    Write(frame);
}

void ClientPort::Notify(std::string_view payload) {
    std::string frame = Framed(payload);
    frame.front() = '%';
    Write(frame);
}

void ClientPort::Write(std::string_view bytes) {
    socket_.Write(bytes, After(kToTakeAReply));
}

}  // namespace target::gdb
