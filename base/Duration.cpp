// The units, and the bound that keeps every sum of a few durations far from an overflow.

#include "base/Duration.h"

#include <charconv>
#include <cstdint>
#include <utility>

namespace base {

std::optional<std::chrono::nanoseconds> ParseDuration(std::string_view text) {
    using Unit = std::pair<std::string_view, std::uint64_t>;
    // "s" ends the others, too, and so comes last.
    static constexpr Unit kUnits[] = {
        {"ns", 1}, {"us", 1'000}, {"ms", 1'000'000}, {"s", 1'000'000'000}};
    constexpr std::uint64_t kHour = 3'600'000'000'000;
    if (text == "0") return std::chrono::nanoseconds(0);
    for (const auto& [suffix, factor] : kUnits) {
        if (!text.ends_with(suffix)) continue;
        text.remove_suffix(suffix.size());
        std::uint64_t count = 0;
        const char* const end = text.data() + text.size();
        const auto [rest, error] = std::from_chars(text.data(), end, count, 10);
        if (error != std::errc() || rest != end || count > kHour / factor) return std::nullopt;
        return std::chrono::nanoseconds(count * factor);
    }
    return std::nullopt;
}

}  // namespace base
