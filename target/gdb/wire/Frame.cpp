// Checksums, escapes and shortened runs.

#include "target/gdb/wire/Frame.h"

#include <numeric>

#include "base/Hex.h"

namespace target::gdb {

namespace {

constexpr char kEscape = '}';
constexpr char kEscapeMask = 0x20;
constexpr char kRun = '*';
constexpr int kRunBias = 29;

// The count behind the mark is a printable character; it says how often the byte before the mark
// comes again.
std::optional<std::string> WithRunsExpanded(std::string_view raw) {
    std::string expanded;
    for (std::size_t i = 0; i < raw.size(); ++i) {
        if (raw[i] != kRun) {
            expanded += raw[i];
            continue;
        }
        if (expanded.empty() || ++i == raw.size()) return std::nullopt;
        const int repeats = static_cast<unsigned char>(raw[i]) - kRunBias;
        if (repeats < 3 || repeats > 126 - kRunBias) return std::nullopt;
        expanded.append(static_cast<std::size_t>(repeats), expanded.back());
        if (expanded.size() > kPayloadMax) return std::nullopt;
    }
    return expanded;
}

std::string Unescaped(std::string_view escaped) {
    std::string bytes;
    bytes.reserve(escaped.size());
    for (std::size_t i = 0; i < escaped.size(); ++i) {
        if (escaped[i] == kEscape && i + 1 < escaped.size())
            bytes += static_cast<char>(escaped[++i] ^ kEscapeMask);
        else
            bytes += escaped[i];
    }
    return bytes;
}

unsigned char Sum(std::string_view payload) {
    return std::accumulate(
        payload.begin(), payload.end(), static_cast<unsigned char>(0),
        [](unsigned char sum, char byte) { return static_cast<unsigned char>(sum + byte); });
}

}  // namespace

std::string Framed(std::string_view payload) {
    std::string frame = "$";
    frame += payload;
    frame += '#';
    return frame + base::ToHex(std::string(1, static_cast<char>(Sum(payload))));
}

bool NeedsEscape(char byte) {
    return byte == '$' || byte == '#' || byte == kEscape || byte == kRun;
}

std::string Escaped(std::string_view bytes) {
    std::string escaped;
    escaped.reserve(bytes.size());
    for (const char byte : bytes) {
        if (NeedsEscape(byte)) escaped += kEscape;
        escaped += NeedsEscape(byte) ? static_cast<char>(byte ^ kEscapeMask) : byte;
    }
    return escaped;
}

// Bytes that were taken are given up here, once for each arrival, and not one by one.
void FrameDecoder::Feed(std::string_view bytes) {
    arrived_.erase(0, taken_);
    taken_ = 0;
    arrived_ += bytes;
}

std::optional<Frame> FrameDecoder::Next() {
    while (taken_ < arrived_.size()) {
        auto frame = Take(arrived_[taken_++]);
        // Nobody sends a damaged notification again, and so nobody is to be asked for it.
        const bool lost =
            frame && frame->kind == Frame::Kind::Damaged && kind_ == Frame::Kind::Notification;
        if (frame && !lost) return frame;
    }
    return std::nullopt;
}

std::optional<Frame> FrameDecoder::Take(char byte) {
    switch (state_) {
        case State::Between:
            return TakeBetween(byte);
        case State::Payload:
            // A start mark is never part of a payload: what came before it was cut off.
            if (byte == '$') return TakeBetween(byte);
            if (byte == '#') {
                state_ = State::FirstDigit;
            } else if (raw_.size() <
                       kPayloadMax) {  // or whoever sends without end takes all memory
                raw_ += byte;
            } else {
                tooLong_ = true;
            }
            return std::nullopt;
        case State::FirstDigit:
            firstDigit_ = byte;
            state_ = State::SecondDigit;
            return std::nullopt;
        case State::SecondDigit:
            state_ = State::Between;
            return Finish(byte);
    }
    return std::nullopt;
}

std::optional<Frame> FrameDecoder::TakeBetween(char byte) {
    switch (byte) {
        case '+':
            return Frame{Frame::Kind::Ack, {}};
        case '-':
            return Frame{Frame::Kind::Nak, {}};
        case kInterrupt:
            return Frame{Frame::Kind::Interrupt, {}};
        case '$':
        case '%':
            kind_ = byte == '$' ? Frame::Kind::Packet : Frame::Kind::Notification;
            state_ = State::Payload;
            raw_.clear();
            tooLong_ = false;
            return std::nullopt;
        default:
            return std::nullopt;
    }
}

Frame FrameDecoder::Finish(char lastDigit) {
    if (tooLong_) return {Frame::Kind::Damaged, "a packet longer than any that was asked for"};
    const int high = base::HexDigitValue(firstDigit_);
    const int low = base::HexDigitValue(lastDigit);
    if (high < 0 || low < 0 || (high << 4 | low) != Sum(raw_))
        return {Frame::Kind::Damaged, "a packet with a wrong checksum"};
    // The checksum is that of the bytes on the wire. Runs are expanded before escapes are undone: a
    // '*' that is data stands escaped.
    if (sender_ == Sender::Client) return {kind_, Unescaped(raw_)};
    const auto expanded = WithRunsExpanded(raw_);
    if (!expanded) return {Frame::Kind::Damaged, "a packet with a malformed run"};
    return {kind_, Unescaped(*expanded)};
}

}  // namespace target::gdb
