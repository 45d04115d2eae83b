// What the terminal behind a stream can do.

#pragma once

#include <cstddef>
#include <cstdio>

namespace host {

bool IsTerminal(std::FILE* stream);

/// How wide the terminal is; 80 for a stream that isn't one.
std::size_t TerminalColumns(std::FILE* stream);

}  // namespace host
