// How what a host did is shown in a line: fit for any display, wherever it came from.

#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace hostcheck {

using Bytes = std::vector<std::uint8_t>;

/// Between quotation marks, at most 160 characters of it, with everything but printable ASCII as
/// \xNN.
std::string Quoted(const std::string& text);

/// "0x400FE000".
std::string HexWord(std::uint32_t value);

/// "c0 1d be ef"; of more than 16 bytes, the first 16 and three full stops.
std::string HexBytes(const Bytes& bytes);

}  // namespace hostcheck
