// What the fuzz targets demand. A demand that isn't met ends the process, which libFuzzer reports
// together with the input.

#pragma once

#include <cstdio>
#include <cstdlib>
#include <cstring>

inline void Require(bool met, const char* what) {
    if (met) return;
    std::fprintf(stderr, "Not met: %s\n", what);
    std::abort();
}

/// A text that crosses the boundary ends, and can be read up to there.
inline void RequireText(const char* text) {
    Require(text != nullptr && std::strlen(text) < 1'000'000, "a text is NUL-terminated");
}
