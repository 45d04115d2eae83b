// A table for each byte that is shifted out at the top.

#include "base/Crc32.h"

#include <array>

namespace base {

namespace {

constexpr std::uint32_t kPolynomial = 0x04C11DB7;

constexpr std::array<std::uint32_t, 256> MakeTable() {
    std::array<std::uint32_t, 256> table{};
    for (std::uint32_t byte = 0; byte < 256; ++byte) {
        std::uint32_t crc = byte << 24;
        for (int bit = 0; bit < 8; ++bit)
            crc = crc << 1 ^ ((crc & 0x80000000) != 0 ? kPolynomial : 0);
        table.at(byte) = crc;
    }
    return table;
}

constexpr std::array<std::uint32_t, 256> kTable = MakeTable();

}  // namespace

std::uint32_t AddToCrc32(std::uint32_t crc, std::string_view bytes) {
    for (const char byte : bytes)
        crc = crc << 8 ^ kTable.at(crc >> 24 ^ static_cast<unsigned char>(byte));
    return crc;
}

}  // namespace base
