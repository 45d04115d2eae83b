// The checksum that GDB's "compare-sections" asks for.

#pragma once

#include <cstdint>
#include <functional>
#include <string>

namespace target::gdb {

/// The answer to "qCRC": "C" and the checksum of that memory, which is read piece by piece.
std::string SectionChecksum(
    std::uint32_t address, std::uint32_t sizeBytes,
    const std::function<std::string(std::uint32_t address, std::uint32_t sizeBytes)>& read);

}  // namespace target::gdb
