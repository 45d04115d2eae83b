// Hexadecimal digits: bytes as pairs of them, and numbers. Nothing here depends on the locale.

#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

namespace base {

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

/// Two lower-case digits for each byte.
std::string ToHex(std::string_view bytes);

/// Appends two upper-case digits for each byte.
void AppendHex(std::string& text, std::span<const std::uint8_t> bytes);

/// The bytes of a whole text of digit pairs, which may be empty; nothing for any other text.
std::optional<std::string> FromHex(std::string_view digits);

/// The number of 1 to 16 digits with nothing around them.
std::optional<std::uint64_t> ParseHexDigits(std::string_view digits);

/// A whole text that is a number of up to 32 bits, with or without "0x".
std::optional<std::uint32_t> ParseHex32(std::string_view text);

/// "0x3ffff".
std::string HexText(std::uint32_t value);

}  // namespace base
