// The parts of a packet's text.

#pragma once

#include <string_view>

namespace target::gdb {

/// The text up to the first `separator`, which is taken off `rest` with it; all of `rest` where
/// there is none.
inline std::string_view TakeUntil(std::string_view& rest, char separator) {
    const std::size_t end = rest.find(separator);
    const std::string_view taken = rest.substr(0, end);
    rest = end == std::string_view::npos ? std::string_view() : rest.substr(end + 1);
    return taken;
}

}  // namespace target::gdb
