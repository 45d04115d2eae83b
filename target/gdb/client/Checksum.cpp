// The part of GdbTarget that lets the server sum up memory, and doesn't believe it unseen.

#include <fmt/format.h>

#include <charconv>
#include <chrono>

#include "base/Crc32.h"
#include "target/gdb/client/GdbTarget.h"

namespace target::gdb {

namespace {

// What a server reads through its probe to sum it up, if it must.
constexpr std::uint32_t kSlowestBytesPerMs = 32;

constexpr std::size_t kProofSize = 256;

/// Bytes of which no two blocks look alike. What a server has kept of one number isn't true for
/// the next.
std::string ProofBytes(unsigned number) {
    std::string bytes(kProofSize, '\0');
    std::uint32_t state = 0x2545F491U + number;
    for (char& byte : bytes) {
        state = state * 1664525U + 1013904223U;
        byte = static_cast<char>(state >> 24);
    }
    return bytes;
}

std::optional<std::uint32_t> ParseChecksum(const std::string& reply) {
    std::uint32_t crc = 0;
    const char* end = reply.data() + reply.size();
    if (reply.size() < 2 || reply[0] != 'C') return std::nullopt;
    const auto [parsed, error] = std::from_chars(reply.data() + 1, end, crc, 16);
    return error == std::errc() && parsed == end ? std::optional(crc) : std::nullopt;
}

}  // namespace

std::optional<std::uint32_t> GdbTarget::Checksum(std::uint32_t address, std::uint32_t sizeBytes) {
    std::optional<std::uint32_t> crc;
    const auto describe = [&] {
        return fmt::format("Summing up {} bytes at 0x{:08X}", sizeBytes, address);
    };
    Perform(describe, [&] {
        if (checksumRefused_ || started_ || !core_.IsStopped()) return;
        if (!checksumProved_) checksumProved_ = ProveChecksum();
        checksumRefused_ = !checksumProved_;
        if (checksumProved_) crc = ServerChecksum(address, sizeBytes);
    });
    return crc;
}

/// Nothing when the server doesn't know the request, or can't read there.
std::optional<std::uint32_t> GdbTarget::ServerChecksum(std::uint32_t address,
                                                       std::uint32_t sizeBytes) {
    const std::string request = fmt::format("qCRC:{:x},{:x}", address, sizeBytes);
    const std::chrono::milliseconds reading(sizeBytes / kSlowestBytesPerMs);
    const std::string reply = connection_.Ask(request, options_.timeout + reading);
    if (IsRefusal(reply)) return std::nullopt;
    const auto crc = ParseChecksum(reply);
    if (!crc) connection_.Reject(request, reply);
    return crc;
}

/// Two sums over the same place, of which a server that has kept an answer gets one wrong. It is
/// behind the mailbox, where the loader is: servers that sum up on the target use the start of RAM.
bool GdbTarget::ProveChecksum() {
    const std::uint32_t address = mailbox_.address + mailbox_.sizeBytes;
    std::string before;
    bool right = true;
    try {
        before = memory_.Read(address, kProofSize);
        for (unsigned number = 0; number < 2 && right; ++number) {
            const std::string bytes = ProofBytes(number);
            memory_.Write(address, bytes);
            const std::uint32_t sum = base::AddToCrc32(base::kCrc32Begin, bytes);
            right = ServerChecksum(address, kProofSize) == sum;
        }
    } catch (const ProtocolError&) {
        if (connection_.IsLost()) throw;
        right = false;  // no RAM there, so nothing is proved
    }
    memory_.Write(address, before);
    return right;
}

}  // namespace target::gdb
