// How failures cross the binary boundary: the host's error texts become exceptions on the way in,
// exceptions become kept error texts on the way out.

#pragma once

#include <exception>
#include <stdexcept>
#include <string>

/// Throws std::runtime_error with the text that a host slot returned, unless it is null.
inline void ThrowOnError(const char* errorText) {
    if (errorText != nullptr) throw std::runtime_error(errorText);
}

/// Keeps a text where the caller of the library can read it for a while, and returns it. When
/// there is no memory left to keep it, a static text stands in: nothing may be thrown out here.
[[nodiscard]] inline const char* KeepErrorText(std::string& kept, const char* text) noexcept {
    try {
        kept.assign(text);
        return kept.c_str();
    } catch (const std::exception&) {
        return "Out of memory.";
    }
}
