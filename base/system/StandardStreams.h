// The three streams that every process is given.

#pragma once

#include "base/system/Descriptor.h"

namespace base {

constexpr int kStandardInput = 0;
constexpr int kStandardOutput = 1;
constexpr int kStandardError = 2;

/// What standard input is called among files.
extern const char* const kStandardInputName;

/// To be called before any file is opened: a standard stream that is closed would lend its number
/// to the next file, which then would take messages for contents. Its place is taken by one that
/// answers each use with an error.
void OccupyStandardStreams();

/// The same stream under a number of its own, which can be closed.
Descriptor Duplicate(int standardStream);

}  // namespace base
