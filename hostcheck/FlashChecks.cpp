// Reads of flash, as a blank check, a checksum and the edges of a section ask for it.

#include <algorithm>

#include "hostcheck/Checks.h"
#include "hostcheck/Patterns.h"
#include "hostcheck/RomAlias.h"

namespace hostcheck {

namespace {

constexpr std::uint32_t kLargestRead = 32752;
constexpr std::uint32_t kBlockBytes = 128;

Bytes ReadInBlocks(CheckedHost& host, std::uint32_t size) {
    Bytes bytes;
    for (std::uint32_t at = 0; at < size; at += kBlockBytes) {
        const Bytes block = host.Read(at, std::min(kBlockBytes, size - at), 1, kFlashPage);
        bytes.insert(bytes.end(), block.begin(), block.end());
    }
    return bytes;
}

std::string ReadsFlash(CheckedHost& host) {
    host.Read(0, 2048, 1, kFlashPage);
    return "";
}

// A host that divides a read has the first part right; so all of it is compared.
std::string ReadsTheLargestAmount(CheckedHost& host) {
    Bytes blocks;
    try {
        blocks = ReadInBlocks(host, kLargestRead);
    } catch (const Breach& breach) {
        throw NotChecked(std::string("it can't be read in small pieces: ") + breach.what());
    }
    RequireEqual(host.Read(0, kLargestRead, 1, kFlashPage), blocks,
                 "in one call instead of blocks of 128");
    return std::ranges::count(blocks, blocks.front()) == kLargestRead
               ? "all of it is " + HexBytes({blocks.front()}) +
                     ", so that parts in a wrong order wouldn't show"
               : "";
}

std::string ReadsFlashOnThatPage(CheckedHost& host) {
    constexpr std::uint32_t address = 125;
    constexpr std::size_t size = 67;
    ClearRomAlias(host);
    RequireEqual(host.Read(address, size, 1, host.page), host.Read(address, size, 1, kFlashPage),
                 "on page " + std::to_string(host.page) + " instead of page 0");
    return "";
}

// The one change of what is read there that harms no flash: the ROM that lies over it goes away.
std::string ReadsFlashAnew(CheckedHost& host) {
    host.Reset(true);
    if (!RomLiesOverFlash(host)) throw NotChecked("after a reset, no ROM lies over the flash");
    const Bytes rom = host.Read(0, kBlockBytes, 1, kFlashPage);
    ClearRomAlias(host);
    if (host.Read(0, kBlockBytes, 1, kFlashPage) == rom)
        throw Breach("the bytes of the ROM that lay over it, from a cache");
    return "";
}

constexpr Check kFlashChecks[] = {
    {Stage::Initialize, "ReadMemory", "2048 bytes of flash on page 0", ReadsFlash},
    {Stage::Initialize, "ReadMemory", "32752 bytes of flash in one call", ReadsTheLargestAmount},
    {Stage::LoadBegins, "ReadMemory", "flash as it is now, not as it was read before",
     ReadsFlashAnew},
    {Stage::LoadBegins, "ReadMemory", "flash on the page given to WriteDataToFlash",
     ReadsFlashOnThatPage},
};

}  // namespace

std::span<const Check> FlashChecks() {
    return kFlashChecks;
}

}  // namespace hostcheck
