// Cutting transfers into packets, in the form that the server takes.

#include "target/gdb/client/MemoryPort.h"

#include <fmt/format.h>

#include <algorithm>

#include "base/Hex.h"

namespace target::gdb {

namespace {

// A transfer goes out in blocks, one after the other. When one fails, those before it have been
// made and those behind it haven't. Blocks end at multiples of a word, so that none is moved in
// two halves. Nothing is told of how far a transfer came, so whoever gets an error takes all of
// it for unknown.

constexpr std::size_t kWord = 4;

// How many of the next bytes make a block that ends at a multiple of 4, if there are at most
// `room`; the last block ends where the bytes do.
std::size_t BlockSize(std::uint32_t address, std::size_t left, std::size_t room) {
    if (left <= room) return left;
    const std::size_t beyond = (address + room) % kWord;
    return room > beyond ? room - beyond : room;
}

// How many bytes fit into so many characters when those that need it are escaped.
std::size_t FittingEscaped(std::string_view bytes, std::size_t characters) {
    std::size_t count = 0;
    for (; count < bytes.size(); ++count) {
        const std::size_t cost = NeedsEscape(bytes[count]) ? 2 : 1;
        if (cost > characters) break;
        characters -= cost;
    }
    return count;
}

template <typename Step>
void ForEachBlock(std::uint32_t address, std::size_t count, Step step) {
    for (std::size_t done = 0; done < count;)
        done += step(static_cast<std::uint32_t>(address + done), done);
}

}  // namespace

std::string MemoryPort::Read(std::uint32_t address, std::size_t count) {
    std::string bytes;
    const std::size_t room = (packetSize_ - kFrameSize) / 2;
    ForEachBlock(address, count, [&](std::uint32_t at, std::size_t done) {
        const std::size_t size = BlockSize(at, count - done, room);
        const std::string request = fmt::format("m{:x},{:x}", at, size);
        const std::string reply = connection_.Ask(request);
        auto block = base::FromHex(reply);
        if (!block || block->empty() || block->size() > size) connection_.Reject(request, reply);
        // What is short ends where the next request can begin with a whole word.
        if (block->size() < size) {
            const std::size_t beyond = (at + block->size()) % kWord;
            block->resize(block->size() - std::min(beyond, block->size()));
        }
        if (block->empty()) connection_.Reject(request, reply);
        bytes += *block;
        return block->size();
    });
    return bytes;
}

void MemoryPort::Write(std::uint32_t address, std::string_view bytes) {
    // One word goes the way that every server has implemented as one access.
    if (bytes.size() > kWord && TakesBinary(address))
        WriteBinary(address, bytes);
    else
        WriteHex(address, bytes);
}

void MemoryPort::WriteHex(std::uint32_t address, std::string_view bytes) {
    ForEachBlock(address, bytes.size(), [&](std::uint32_t at, std::size_t done) {
        const std::size_t head = fmt::format("M{:x},{:x}:", at, bytes.size()).size();
        const std::size_t room = (packetSize_ - kFrameSize - head) / 2;
        const std::size_t size = BlockSize(at, bytes.size() - done, room);
        connection_.RequireOk(
            fmt::format("M{:x},{:x}:{}", at, size, base::ToHex(bytes.substr(done, size))));
        return size;
    });
}

void MemoryPort::WriteBinary(std::uint32_t address, std::string_view bytes) {
    ForEachBlock(address, bytes.size(), [&](std::uint32_t at, std::size_t done) {
        const std::string_view left = bytes.substr(done);
        const std::size_t head = fmt::format("X{:x},{:x}:", at, left.size()).size();
        const std::size_t room = FittingEscaped(left, packetSize_ - kFrameSize - head);
        const std::size_t size = BlockSize(at, left.size(), room);
        connection_.RequireOk(fmt::format("X{:x},{:x}:", at, size) + Escaped(left.substr(0, size)));
        return size;
    });
}

bool MemoryPort::TakesBinary(std::uint32_t address) {
    if (binary_ == Binary::Unknown) {
        const bool taken = connection_.Agrees(fmt::format("X{:x},0:", address));
        binary_ = taken ? Binary::Taken : Binary::Refused;
    }
    return binary_ == Binary::Taken;
}

}  // namespace target::gdb
