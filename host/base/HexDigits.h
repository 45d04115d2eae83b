// Hexadecimal digits and bytes, for the formats that are text.

#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>

namespace host::image {

using Bytes = std::span<const std::uint8_t>;

/// 0 to 15, or -1 for what isn't a hexadecimal digit. A table, because an image of many megabytes
/// asks twice for each byte.
inline int HexDigitValue(char digit) {
    static constexpr auto kValues = [] {
        std::array<std::int8_t, 256> values{};
        values.fill(-1);
        for (std::uint8_t i = 0; i < 10; ++i)
            values['0' + i] = static_cast<std::int8_t>(i);
        for (std::uint8_t i = 10; i < 16; ++i) {
            values['A' + i - 10] = static_cast<std::int8_t>(i);
            values['a' + i - 10] = static_cast<std::int8_t>(i);
        }
        return values;
    }();
    return kValues[static_cast<unsigned char>(digit)];
}

/// Appends two upper-case digits for each byte.
inline void AppendHex(std::string& text, Bytes bytes) {
    static constexpr char kDigits[] = "0123456789ABCDEF";
    for (const std::uint8_t byte : bytes) {
        text += kDigits[byte >> 4];
        text += kDigits[byte & 0xF];
    }
}

}  // namespace host::image
