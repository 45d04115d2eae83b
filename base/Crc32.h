// The CRC-32 by which GDB compares memory (qCRC): polynomial 0x04c11db7 from the top bit down,
// begun with all ones, nothing inverted.

#pragma once

#include <cstdint>
#include <string_view>

namespace base {

inline constexpr std::uint32_t kCrc32Begin = 0xFFFFFFFF;

/// Adds bytes to what was summed up so far.
std::uint32_t AddToCrc32(std::uint32_t crc, std::string_view bytes);

}  // namespace base
