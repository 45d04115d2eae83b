// Memory accesses: writes in the RAM behind the loader's buffers and parameter blocks alone, where
// what lies there is put back; reads also of flash and of one register.

#include <algorithm>
#include <numeric>

#include "hostcheck/Checks.h"
#include "hostcheck/RamWindow.h"

namespace hostcheck {

namespace {

constexpr std::uint32_t kWhere = RamWindow::kStart;
constexpr std::size_t kWidths[] = {1, 2, 4};

/// The family has nothing here: flash and ROM end below it, RAM begins above.
constexpr std::uint32_t kUnmapped = 0x10000000;

std::string Hex(const Bytes& bytes) {
    static constexpr char digits[] = "0123456789abcdef";
    std::string text;
    for (const std::uint8_t byte : bytes)
        text.append(text.empty() ? "" : " ").append({digits[byte / 16], digits[byte % 16]});
    return text;
}

void RequireEqual(const Bytes& came, const Bytes& expected, const std::string& doing) {
    if (came != expected) throw Breach(Hex(came) + " instead of " + Hex(expected) + ", " + doing);
}

Bytes Counted(std::size_t bytes, std::uint8_t first) {
    Bytes counted(bytes);
    std::iota(counted.begin(), counted.end(), first);
    return counted;
}

/// The one register that is read: every plug-in begins with it.
constexpr std::uint32_t kIdentification = 0x400FE000;

std::string ReadsARegister(CheckedHost& host) {
    return "it reads " + Hex(host.Read(kIdentification, 4, 4)) + ", low byte first";
}

std::string ReadsAWord(CheckedHost& host) {
    host.Read(kWhere, 4, 4);
    return "";
}

std::string KeepsEveryWidth(CheckedHost& host) {
    const RamWindow window(host, 16);
    std::uint8_t first = 0x11;
    for (const std::size_t written : kWidths) {
        for (const std::size_t read : kWidths) {
            const Bytes bytes = Counted(16, first++);
            host.Write(kWhere, bytes, written);
            RequireEqual(host.Read(kWhere, bytes.size(), read), bytes,
                         "written with a width of " + std::to_string(written) +
                             " and read with a width of " + std::to_string(read));
        }
    }
    return "";
}

std::string LeavesNeighbours(CheckedHost& host) {
    const RamWindow window(host, 16);
    for (const std::size_t width : kWidths) {
        Bytes bytes = Counted(16, 0x40);
        host.Write(kWhere, bytes, 4);
        const Bytes written(width, 0xEE);
        host.Write(kWhere + 4, written, width);
        std::copy(written.begin(), written.end(), bytes.begin() + 4);
        RequireEqual(host.Read(kWhere, bytes.size(), 1), bytes,
                     "after one element of width " + std::to_string(width) + " was written at 4");
    }
    return "";
}

std::string WritesInOrder(CheckedHost& host) {
    const RamWindow window(host, 16);
    Bytes expected(16, 0);
    host.Write(kWhere, expected, 4);
    for (std::size_t offset = 0; offset + 8 <= expected.size(); ++offset) {
        const Bytes bytes = Counted(8, static_cast<std::uint8_t>(16 * offset));
        host.Write(kWhere + static_cast<std::uint32_t>(offset), bytes, 1);
        std::copy(bytes.begin(), bytes.end(),
                  expected.begin() + static_cast<std::ptrdiff_t>(offset));
    }
    RequireEqual(host.Read(kWhere, expected.size(), 4), expected, "after writes over each other");
    return "";
}

// As much as goes to the loader's buffers at a time.
std::string MovesAWholeChunk(CheckedHost& host) {
    const RamWindow window(host, 2048);
    Bytes bytes(2048);
    for (std::size_t i = 0; i < bytes.size(); ++i)
        bytes[i] = static_cast<std::uint8_t>(i * 7 + i / 256);
    host.Write(kWhere, bytes, 1);
    const Bytes came = host.Read(kWhere, bytes.size(), 1);
    const auto at = std::mismatch(came.begin(), came.end(), bytes.begin()).first - came.begin();
    if (came != bytes) throw Breach("other bytes from offset " + std::to_string(at) + " on");
    return "";
}

// A blank check and a checksum read flash so, on a page of its own.
constexpr std::int16_t kFlashPage = 0;
constexpr std::uint32_t kLargestRead = 32752;

std::string ReadsFlash(CheckedHost& host) {
    host.Read(0, 2048, 1, kFlashPage);
    return "";
}

// A host that moves only part of it leaves the end of the buffer as it was.
std::string ReadsTheLargestAmount(CheckedHost& host) {
    Bytes end;
    try {
        end = host.Read(kLargestRead - 16, 16, 1, kFlashPage);
    } catch (const Breach& breach) {
        throw NotChecked(std::string("the last 16 of them alone can't be read: ") + breach.what());
    }
    const Bytes came = host.Read(0, kLargestRead, 1, kFlashPage);
    RequireEqual({came.end() - 16, came.end()}, end, "in the last 16");
    return "";
}

template <typename Access>
std::string RefusedWithAText(CheckedHost& host, Access access) {
    const auto error = host.Ask(access);
    if (!error) throw Breach("null");
    return "it says " + Quoted(*error);
}

std::string RefusesUnmappedReads(CheckedHost& host) {
    Bytes buffer(16);
    return RefusedWithAText(host, [&](IFlashHost& h) {
        return h.ReadMemory(buffer.data(), buffer.size(), kUnmapped, kGeneralPage, 1);
    });
}

std::string RefusesUnmappedWrites(CheckedHost& host) {
    const Bytes buffer(16);
    return RefusedWithAText(host, [&](IFlashHost& h) {
        return h.WriteMemory(buffer.data(), buffer.size(), kUnmapped, kGeneralPage, 1);
    });
}

constexpr Check kMemoryChecks[] = {
    {Stage::Creation, "ReadMemory", "the identification register at 0x400FE000", ReadsARegister},
    {Stage::Creation, "ReadMemory", "a word of RAM during CreateFlashDevice2", ReadsAWord},
    {Stage::Initialize, "WriteMemory", "the same bytes in all widths, in the order of the buffer",
     KeepsEveryWidth},
    {Stage::Initialize, "WriteMemory", "no change beside what is written", LeavesNeighbours},
    {Stage::Initialize, "WriteMemory", "writes in the order of the calls", WritesInOrder},
    {Stage::Initialize, "WriteMemory", "2048 bytes in one call", MovesAWholeChunk},
    {Stage::Initialize, "ReadMemory", "2048 bytes of flash on page 0", ReadsFlash},
    {Stage::Initialize, "ReadMemory", "32752 bytes of flash in one call", ReadsTheLargestAmount},
    {Stage::Initialize, "ReadMemory", "an error text at 0x10000000, where nothing is",
     RefusesUnmappedReads},
    {Stage::Initialize, "WriteMemory", "an error text at 0x10000000, where nothing is",
     RefusesUnmappedWrites},
    {Stage::Initialize, "ReadMemory", "success after an access that failed", ReadsAWord},
};

}  // namespace

std::span<const Check> MemoryChecks() {
    return kMemoryChecks;
}

}  // namespace hostcheck
