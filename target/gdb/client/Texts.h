// Pieces of the client's error texts.

#pragma once

#include <string>

namespace target::gdb {

/// ": " and the last lines of what a command put out; nothing when that is nothing.
std::string LastLines(const std::string& output);

}  // namespace target::gdb
