// Writing files whole or not at all.

#pragma once

#include <string>

namespace host {

/// Replaces the file at `path`, or creates it, through a temporary file beside it: whoever looks
/// finds the old contents or the new ones. What is no regular file (a pipe, a device) is written
/// directly. `what` stands for the contents in the Failure (BadFile).
void WriteWholeFile(const std::string& path, const std::string& contents, const char* what);

}  // namespace host
