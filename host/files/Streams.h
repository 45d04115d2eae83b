// Reading and writing descriptors that may block: pipes, terminals, devices. Ctrl-C ends the wait.

#pragma once

#include <string_view>

namespace host {

/// Waits until the descriptor is ready for `events` (POLLIN, POLLOUT). False after Ctrl-C, unless
/// it is ready all the same.
bool WaitUntilReady(int descriptor, short events);

/// Writes everything; 0, or the error number: EINTR after Ctrl-C when nobody takes the rest.
int WriteAll(int descriptor, std::string_view bytes);

/// To be called before any file is opened: a standard stream that is closed would lend its number
/// to the next file, which then would take messages for contents. Its place is taken by one that
/// answers each use with an error.
void OccupyStandardStreams();

}  // namespace host
