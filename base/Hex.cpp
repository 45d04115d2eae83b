// Digits to bytes and numbers, and back.

#include "base/Hex.h"

#include <charconv>
#include <limits>

namespace base {

std::string ToHex(std::string_view bytes) {
    static constexpr char kDigits[] = "0123456789abcdef";
    std::string digits;
    digits.reserve(bytes.size() * 2);
    for (const char byte : bytes) {
        digits += kDigits[static_cast<unsigned char>(byte) >> 4];
        digits += kDigits[static_cast<unsigned char>(byte) & 0xF];
    }
    return digits;
}

void AppendHex(std::string& text, std::span<const std::uint8_t> bytes) {
    static constexpr char kDigits[] = "0123456789ABCDEF";
    for (const std::uint8_t byte : bytes) {
        text += kDigits[byte >> 4];
        text += kDigits[byte & 0xF];
    }
}

std::optional<std::string> FromHex(std::string_view digits) {
    if (digits.size() % 2 != 0) return std::nullopt;
    std::string bytes;
    bytes.reserve(digits.size() / 2);
    for (std::size_t i = 0; i < digits.size(); i += 2) {
        const int high = HexDigitValue(digits[i]);
        const int low = HexDigitValue(digits[i + 1]);
        if (high < 0 || low < 0) return std::nullopt;
        bytes += static_cast<char>(high << 4 | low);
    }
    return bytes;
}

std::optional<std::uint64_t> ParseHexDigits(std::string_view digits) {
    if (digits.empty() || digits.size() > 16) return std::nullopt;
    std::uint64_t number = 0;
    for (const char digit : digits) {
        const int value = HexDigitValue(digit);
        if (value < 0) return std::nullopt;
        number = number << 4 | static_cast<std::uint64_t>(value);
    }
    return number;
}

std::optional<std::uint32_t> ParseHex32(std::string_view text) {
    if (text.starts_with("0x") || text.starts_with("0X")) text.remove_prefix(2);
    // People write leading zeros at will.
    const std::size_t zeros = text.find_first_not_of('0');
    if (zeros != std::string_view::npos)
        text.remove_prefix(zeros);
    else if (!text.empty())
        return 0;
    const auto number = ParseHexDigits(text);
    if (!number || *number > std::numeric_limits<std::uint32_t>::max()) return std::nullopt;
    return static_cast<std::uint32_t>(*number);
}

std::string HexText(std::uint32_t value) {
    char digits[8];
    const auto [end, error] = std::to_chars(digits, digits + sizeof digits, value, 16);
    return "0x" + std::string(digits, end);
}

}  // namespace base
