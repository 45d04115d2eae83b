// OptionValues: the forms of value that a device option can take. They read the same under any
// locale.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace target {

/// A decimal number, or a hexadecimal one with "0x".
std::optional<std::uint64_t> ParseNumber(std::string_view text);

/// A number of bytes, with an optional suffix K or M.
std::optional<std::uint64_t> ParseSize(std::string_view text);

/// "A" to "Z" counts from 0; otherwise a number up to 255.
std::optional<std::uint8_t> ParseRevision(std::string_view text);

/// The shortest form that ParseSize reads back.
std::string FormatSize(std::uint64_t bytes);

}  // namespace target
