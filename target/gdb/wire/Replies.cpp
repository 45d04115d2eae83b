// One function for each kind of reply.

#include "target/gdb/wire/Replies.h"

#include <fmt/format.h>

#include <algorithm>

#include "base/Hex.h"
#include "target/gdb/wire/Fields.h"

namespace target::gdb {

namespace {

// As much as is worth sending at once.
constexpr std::uint64_t kPacketSizeMax = 0x4000;

}  // namespace

// Three characters, for a longer reply that begins with E can be memory.
bool IsError(std::string_view reply) {
    if (reply.starts_with("E.")) return true;
    return reply.size() == 3 && reply[0] == 'E' &&
           base::ParseHexDigits(reply.substr(1)).has_value();
}

std::string ErrorText(std::string_view reply) {
    constexpr std::size_t kTextMax = 200;
    std::string text(reply.starts_with("E.") ? reply.substr(2, kTextMax) : reply);
    std::ranges::replace_if(
        text, [](char byte) { return byte < ' ' || byte > '~'; }, ' ');
    return text;
}

bool IsRefusal(std::string_view reply) {
    return reply.empty() || IsError(reply);
}

// Whatever follows the number (registers, the thread, the reason) is of no use here, and servers
// differ in it.
std::optional<StopReply> ParseStopReply(std::string_view reply) {
    if (reply.empty()) return std::nullopt;
    const auto number = base::ParseHexDigits(reply.substr(1, 2));
    // The rest of these is no concern of ours: threads, registers, processes.
    switch (reply[0]) {
        case 'S':
        case 'T':
            if (!number || reply.size() < 3) return std::nullopt;
            return StopReply{StopReply::Kind::Stopped, static_cast<unsigned>(*number)};
        case 'W':
        case 'X':
            if (!number || reply.size() < 3) return std::nullopt;
            return StopReply{StopReply::Kind::Exited, static_cast<unsigned>(*number)};
        case 'O': {
            auto text = base::FromHex(reply.substr(1));
            if (!text) return std::nullopt;
            return StopReply{StopReply::Kind::Output, 0, std::move(*text)};
        }
        default:
            return std::nullopt;
    }
}

std::string SignalName(unsigned signal) {
    // The protocol's own numbers, which aren't those of any one system.
    switch (signal) {
        case 2:
            return "SIGINT";
        case 4:
            return "SIGILL";
        case 5:
            return "SIGTRAP";
        case 6:
            return "SIGABRT";
        case 8:
            return "SIGFPE";
        case 10:
            return "SIGBUS";
        case 11:
            return "SIGSEGV";
        default:
            return fmt::format("signal {}", signal);
    }
}

Features ParseFeatures(std::string_view reply) {
    Features features;
    while (!reply.empty()) {
        const std::string_view feature = TakeUntil(reply, ';');
        if (feature.starts_with("PacketSize=")) {
            const auto size = base::ParseHexDigits(feature.substr(11));
            if (size) features.packetSize = std::min(*size, kPacketSizeMax);
        } else if (feature == "QStartNoAckMode+") {
            features.noAckMode = true;
        } else if (feature == "QNonStop+") {
            features.nonStop = true;
        } else if (feature == "qXfer:features:read+") {
            features.description = true;
        }
    }
    return features;
}

bool OffersContinue(std::string_view reply) {
    if (TakeUntil(reply, ';') != "vCont") return false;
    while (!reply.empty()) {
        if (TakeUntil(reply, ';') == "c") return true;
    }
    return false;
}

std::optional<DocumentPiece> ParseDocumentPiece(std::string_view reply) {
    if (reply.empty() || (reply[0] != 'm' && reply[0] != 'l')) return std::nullopt;
    return DocumentPiece{reply[0] == 'l', reply.substr(1)};
}

}  // namespace target::gdb
