// Reading and writing files that may block: pipes, terminals, devices. Ctrl-C ends the wait.

#pragma once

#include <string_view>

#include "base/system/Ready.h"

namespace host {

/// Waits until the file is ready. False after Ctrl-C, unless it is ready all the same.
bool WaitUntilReady(int file, base::Ready ready);

/// Writes everything; 0, or the error number: EINTR after Ctrl-C when nobody takes the rest.
int WriteAll(int file, std::string_view bytes);

}  // namespace host
