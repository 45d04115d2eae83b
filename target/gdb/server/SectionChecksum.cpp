// CRC-32 from the top bit down, without any inversion.

#include "target/gdb/server/SectionChecksum.h"

#include <fmt/format.h>

#include <algorithm>
#include <string_view>

namespace target::gdb {

namespace {

std::uint32_t AddToChecksum(std::uint32_t crc, std::string_view bytes) {
    for (const char byte : bytes) {
        crc ^= std::uint32_t{static_cast<unsigned char>(byte)} << 24;
        for (int bit = 0; bit < 8; ++bit)
            crc = crc << 1 ^ ((crc & 0x80000000) != 0 ? 0x04C11DB7 : 0);
    }
    return crc;
}

}  // namespace

std::string SectionChecksum(
    std::uint32_t address, std::uint32_t sizeBytes,
    const std::function<std::string(std::uint32_t address, std::uint32_t sizeBytes)>& read) {
    constexpr std::uint32_t kPieceSize = 4096;
    std::uint32_t crc = 0xFFFFFFFF;
    for (std::uint32_t done = 0; done < sizeBytes;) {
        const std::uint32_t size = std::min(kPieceSize, sizeBytes - done);
        crc = AddToChecksum(crc, read(address + done, size));
        done += size;
    }
    return fmt::format("C{:x}", crc);
}

}  // namespace target::gdb
