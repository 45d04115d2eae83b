// Reading and writing the values of device options.

#include "target/simulated/OptionValues.h"

#include <fmt/format.h>

#include <array>
#include <charconv>
#include <limits>
#include <utility>

#include "target/simulated/DeviceOptions.h"

namespace target {

namespace {

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

std::optional<std::uint32_t> ParseHex32(std::string_view text) {
    const auto value = ParseDigits(HasHexPrefix(text) ? text.substr(2) : text, 16);
    if (!value || *value > std::numeric_limits<std::uint32_t>::max()) return std::nullopt;
    return static_cast<std::uint32_t>(*value);
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

std::optional<std::chrono::nanoseconds> ParseDuration(std::string_view text) {
    using Unit = std::pair<std::string_view, std::uint64_t>;
    static constexpr std::array<Unit, 4> units = {
        {{"ns", 1}, {"us", 1'000}, {"ms", 1'000'000}, {"s", 1'000'000'000}}};
    if (text == "0") return std::chrono::nanoseconds(0);
    for (const auto& [suffix, factor] : units) {
        if (!text.ends_with(suffix)) continue;
        text.remove_suffix(suffix.size());
        const auto count = Multiply(ParseDigits(text, 10), factor);
        constexpr std::uint64_t kHour = 3'600'000'000'000;
        if (!count || *count > kHour) return std::nullopt;
        return std::chrono::nanoseconds(*count);
    }
    return std::nullopt;
}

std::optional<std::uint8_t> ParseRevision(std::string_view text) {
    if (text.size() == 1 && text[0] >= 'A' && text[0] <= 'Z') {
        return static_cast<std::uint8_t>(text[0] - 'A');
    }
    const auto number = ParseNumber(text);
    if (!number || *number > 0xFF) return std::nullopt;
    return static_cast<std::uint8_t>(*number);
}

std::string FormatSize(std::uint64_t bytes) {
    if (bytes != 0 && bytes % (kKiB * kKiB) == 0) return fmt::format("{}M", bytes / (kKiB * kKiB));
    if (bytes != 0 && bytes % kKiB == 0) return fmt::format("{}K", bytes / kKiB);
    return fmt::format("{}", bytes);
}

}  // namespace target
