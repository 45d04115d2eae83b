// Neither base/Hex.h nor fmt knows the locale.

#include "host/base/Text.h"

#include <fmt/format.h>

#include <array>
#include <cmath>

#include "base/Hex.h"
#include "host/base/Errors.h"

namespace host {

std::uint32_t ParseHexArgument(const std::string& text, const std::string& what) {
    if (const auto value = base::ParseHex32(text)) return *value;
    throw Failure(ExitStatus::WrongUsage,
                  fmt::format("{} '{}' is no hexadecimal number of up to 32 bits; write it as in "
                              "0x1f00 or 1f00",
                              what, text));
}

namespace {

/// "START+LENGTH".
base::AddressRange ParseStartAndLength(const std::string& text, std::size_t plus) {
    const std::uint64_t first = ParseHexArgument(text.substr(0, plus), "the range's start");
    const std::uint64_t length = ParseHexArgument(text.substr(plus + 1), "the range's length");
    if (length == 0 || first + length > std::uint64_t{1} << 32)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("the range '{}' {}", text,
                                  length == 0 ? "has no bytes" : "ends beyond 0xffffffff"));
    return {static_cast<std::uint32_t>(first), static_cast<std::uint32_t>(first + length - 1)};
}

}  // namespace

base::AddressRange ParseRange(const std::string& text) {
    if (const auto plus = text.find('+'); plus != std::string::npos)
        return ParseStartAndLength(text, plus);
    const auto dash = text.find('-');
    if (dash == std::string::npos)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("'{}' is no address range; write the first and the last address, "
                                  "as in 0x1000-0x1fff, or start and length, as in 0x1000+0x1000",
                                  text));
    const base::AddressRange range{
        ParseHexArgument(text.substr(0, dash), "the range's first address"),
        ParseHexArgument(text.substr(dash + 1), "the range's last address")};
    if (range.first > range.last)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("the range '{}' ends before it starts; the first address comes "
                                  "first and the last one belongs to the range",
                                  text));
    return range;
}

std::string RangeText(const base::AddressRange& range) {
    return fmt::format("{:#x}-{:#x}", range.first, range.last);
}

std::string RangesText(const std::vector<base::AddressRange>& ranges) {
    std::string text;
    for (std::size_t i = 0; i < ranges.size(); ++i)
        text += (i == 0 ? "" : i + 1 < ranges.size() ? ", " : " and ") + RangeText(ranges[i]);
    return text;
}

std::string SizeText(std::uint64_t bytes) {
    if (bytes < 1024) return CountText(bytes, "byte");
    constexpr std::array units{"KiB", "MiB", "GiB"};
    double amount = static_cast<double>(bytes) / 1024;
    std::size_t unit = 0;
    // What would be shown as 1024.0 belongs to the next unit.
    for (; amount >= 1023.95 && unit + 1 < units.size(); ++unit)
        amount /= 1024;
    const bool whole = amount == static_cast<double>(static_cast<std::uint64_t>(amount));
    return fmt::format("{:.{}f} {}", amount, whole ? 0 : 1, units[unit]);
}

std::string CountText(std::uint64_t count, const char* thing) {
    return fmt::format("{} {}{}", count, thing, count == 1 ? "" : "s");
}

std::string DurationText(double seconds) {
    if (seconds < 0.001) return "under 1 ms";
    if (seconds < 0.9995) return fmt::format("{:.0f} ms", seconds * 1000);
    if (seconds < 59.95) return fmt::format("{:.1f} s", seconds);
    const auto whole = std::llround(seconds);
    return fmt::format("{}:{:02}", whole / 60, whole % 60);
}

}  // namespace host
