// Summing up piece by piece.

#include "target/gdb/server/SectionChecksum.h"

#include <fmt/format.h>

#include <algorithm>

#include "base/Crc32.h"

namespace target::gdb {

std::string SectionChecksum(
    std::uint32_t address, std::uint32_t sizeBytes,
    const std::function<std::string(std::uint32_t address, std::uint32_t sizeBytes)>& read) {
    constexpr std::uint32_t kPieceSize = 4096;
    std::uint32_t crc = base::kCrc32Begin;
    for (std::uint32_t done = 0; done < sizeBytes;) {
        const std::uint32_t size = std::min(kPieceSize, sizeBytes - done);
        crc = base::AddToCrc32(crc, read(address + done, size));
        done += size;
    }
    return fmt::format("C{:x}", crc);
}

}  // namespace target::gdb
