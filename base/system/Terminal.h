// What the terminal behind a stream can do.

#pragma once

#include <cstddef>
#include <cstdio>

namespace base {

bool IsTerminal(std::FILE* stream);

/// Whether it is a terminal that knows more than lines: colours, and writing over a line.
bool KnowsEscapes(std::FILE* stream);

/// How wide the terminal is; 80 for a stream that isn't one.
std::size_t TerminalColumns(std::FILE* stream);

}  // namespace base
