// Accesses to RAM: writes behind the loader's buffers and parameter blocks alone, where what lies
// there is put back.

#include <algorithm>

#include "hostcheck/Checks.h"
#include "hostcheck/Patterns.h"
#include "hostcheck/RamWindow.h"

namespace hostcheck {

namespace {

constexpr std::uint32_t kWhere = RamWindow::kStart;
constexpr std::size_t kWidths[] = {1, 2, 4};

std::string KeepsEveryWidth(CheckedHost& host) {
    const RamWindow window(host, 16);
    unsigned salt = 0;
    for (const std::size_t written : kWidths) {
        for (const std::size_t read : kWidths) {
            const Bytes bytes = Pattern(16, ++salt);
            host.Write(kWhere, bytes, written);
            RequireEqual(host.Read(kWhere, bytes.size(), read), bytes,
                         "written with a width of " + std::to_string(written) +
                             " and read with a width of " + std::to_string(read));
        }
    }
    return "";
}

/// Writes that many bytes in the middle of others, and looks at all of them.
void RequireNeighboursKept(CheckedHost& host, std::size_t count, std::size_t width) {
    const std::size_t margin = 8 + (width == 1 ? count % 4 : 0);
    Bytes bytes(margin + count + 16 - (margin + count) % 4, 0x5A);
    WriteAll(host, kWhere, bytes);
    const Bytes written = Pattern(count, 0x90);
    host.Write(kWhere + static_cast<std::uint32_t>(margin), written, width);
    std::copy(written.begin(), written.end(), bytes.begin() + static_cast<std::ptrdiff_t>(margin));
    RequireEqual(host.Read(kWhere, bytes.size(), 4), bytes,
                 "after " + std::to_string(count / width) + " of width " + std::to_string(width) +
                     " were written at " + std::to_string(margin));
}

// Single elements are what registers get, odd counts what hosts round up, and the last one is a
// whole buffer of the loader's.
std::string LeavesNeighbours(CheckedHost& host) {
    const RamWindow window(host, RamWindow::kBytesMax);
    for (const std::size_t width : kWidths)
        RequireNeighboursKept(host, width, width);
    for (const std::size_t count : {3U, 5U, 12U, 127U, 255U, 1023U, 2047U, 2048U})
        RequireNeighboursKept(host, count, 1);
    return "";
}

std::string WritesInOrder(CheckedHost& host) {
    const RamWindow window(host, 16);
    Bytes expected(16, 0);
    host.Write(kWhere, expected, 4);
    for (std::size_t offset = 0; offset + 8 <= expected.size(); ++offset) {
        const Bytes bytes = Pattern(8, static_cast<unsigned>(16 * offset + 1));
        host.Write(kWhere + static_cast<std::uint32_t>(offset), bytes, 1);
        std::copy(bytes.begin(), bytes.end(),
                  expected.begin() + static_cast<std::ptrdiff_t>(offset));
    }
    RequireEqual(host.Read(kWhere, expected.size(), 4), expected, "after writes over each other");
    return "";
}

// As much as goes to the loader's buffers at a time.
std::string MovesAWholeChunk(CheckedHost& host) {
    const RamWindow window(host, LoaderMemory::BufferSize);
    const Bytes bytes = Pattern(LoaderMemory::BufferSize);
    host.Write(kWhere, bytes, 1);
    RequireEqual(host.Read(kWhere, bytes.size(), 1), bytes, "written and read in one call each");
    return "";
}

// What lies around a section begins and ends anywhere in a block of 128 bytes.
std::string ReadsAnyPiece(CheckedHost& host) {
    constexpr std::size_t block = 128;
    const RamWindow window(host, block);
    const Bytes bytes = Pattern(block, 0x33);
    host.Write(kWhere, bytes, 4);
    for (std::size_t first = 0; first < block; first += 13) {
        for (const std::size_t behind : {first + 1, first + (block - first) / 2 + 1, block}) {
            const auto from = bytes.begin() + static_cast<std::ptrdiff_t>(first);
            const Bytes expected(from, from + static_cast<std::ptrdiff_t>(behind - first));
            RequireEqual(
                host.Read(kWhere + static_cast<std::uint32_t>(first), expected.size(), 1), expected,
                std::to_string(expected.size()) + " bytes from offset " + std::to_string(first));
        }
    }
    return "";
}

// Both buffers, both parameter blocks and the window, when the loader isn't there: a read of 6 KiB
// whose every byte is known.
std::string ReadsAllItWrote(CheckedHost& host) {
    constexpr std::uint32_t start = LoaderMemory::Buffers;
    constexpr std::size_t piece = 512;
    constexpr std::size_t size = 12 * piece;
    const RamWindow window(host, size, start);
    const Bytes bytes = Pattern(size, 0x51);
    for (std::size_t at = 0; at < size; at += piece) {
        const auto from = bytes.begin() + static_cast<std::ptrdiff_t>(at);
        host.Write(start + static_cast<std::uint32_t>(at), {from, from + piece}, 1);
    }
    RequireEqual(host.Read(start, size, 1), bytes, "read in one call");
    return "";
}

constexpr Check kRamChecks[] = {
    {Stage::Initialize, "WriteMemory", "the same bytes in all widths, in the order of the buffer",
     KeepsEveryWidth},
    {Stage::Initialize, "WriteMemory", "no change beside what is written", LeavesNeighbours},
    {Stage::Initialize, "WriteMemory", "writes in the order of the calls", WritesInOrder},
    {Stage::Initialize, "WriteMemory", "2048 bytes in one call", MovesAWholeChunk},
    {Stage::Initialize, "ReadMemory", "any bytes of a block", ReadsAnyPiece},
    {Stage::Initialize, "ReadMemory", "6144 bytes of RAM in one call", ReadsAllItWrote},
};

}  // namespace

std::span<const Check> RamChecks() {
    return kRamChecks;
}

}  // namespace hostcheck
