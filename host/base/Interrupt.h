// Ctrl-C as a flag. The first one is only remembered, so that the work can end in order; the second
// one ends the process at once.

#pragma once

namespace host {

/// From now on SIGINT and SIGTERM set the flag, and a reader that goes away (SIGPIPE) ends nothing.
void CatchInterrupts();

bool Interrupted();

}  // namespace host
