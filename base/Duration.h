// Durations as people write them: a whole number with a unit.

#pragma once

#include <chrono>
#include <optional>
#include <string_view>

namespace base {

/// "200us", "5s": a whole number with ns, us, ms or s; at most an hour. A bare 0 needs no unit.
std::optional<std::chrono::nanoseconds> ParseDuration(std::string_view text);

}  // namespace base
