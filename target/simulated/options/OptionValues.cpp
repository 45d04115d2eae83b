// Reading and writing the values of device options.

#include "target/simulated/options/OptionValues.h"

#include <fmt/format.h>

#include <charconv>
#include <limits>

#include "target/simulated/options/DeviceOptions.h"

namespace target {

namespace {

// No sign, no blank, no separator, and nothing behind the number: std::from_chars takes none.
std::optional<std::uint64_t> ParseDigits(std::string_view digits, int base) {
    std::uint64_t value = 0;
    const auto [end, error] =
        std::from_chars(digits.data(), digits.data() + digits.size(), value, base);
    if (error != std::errc() || end != digits.data() + digits.size()) return std::nullopt;
    return value;
}

bool HasHexPrefix(std::string_view text) {
    return text.starts_with("0x") || text.starts_with("0X");
}

// Too large is no number, rather than another one.
std::optional<std::uint64_t> Multiply(std::optional<std::uint64_t> number, std::uint64_t factor) {
    if (!number || *number > std::numeric_limits<std::uint64_t>::max() / factor) {
        return std::nullopt;
    }
    return *number * factor;
}

}  // namespace

std::optional<std::uint64_t> ParseNumber(std::string_view text) {
    return HasHexPrefix(text) ? ParseDigits(text.substr(2), 16) : ParseDigits(text, 10);
}

std::optional<std::uint64_t> ParseSize(std::string_view text) {
    if (text.empty()) return std::nullopt;
    const std::string_view digits = text.substr(0, text.size() - 1);
    switch (text.back()) {
        case 'K':
            return Multiply(ParseNumber(digits), kKiB);
        case 'M':
            return Multiply(ParseNumber(digits), kKiB * kKiB);
        default:
            return ParseNumber(text);
    }
}

std::optional<std::uint8_t> ParseRevision(std::string_view text) {
    if (text.size() == 1 && text[0] >= 'A' && text[0] <= 'Z') {
        return static_cast<std::uint8_t>(text[0] - 'A');
    }
    const auto number = ParseNumber(text);
    if (!number || *number > 0xFF) return std::nullopt;
    return static_cast<std::uint8_t>(*number);
}

// 0 has no suffix: "0M" would be right and odd.
std::string FormatSize(std::uint64_t bytes) {
    if (bytes != 0 && bytes % (kKiB * kKiB) == 0) return fmt::format("{}M", bytes / (kKiB * kKiB));
    if (bytes != 0 && bytes % kKiB == 0) return fmt::format("{}K", bytes / kKiB);
    return fmt::format("{}", bytes);
}

}  // namespace target
