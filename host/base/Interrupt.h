// Ctrl-C as a flag. The first one is only remembered, so that the work can end in order; the next
// one, unless it comes with the first, ends the process at once.

#pragma once

#include <signal.h>

namespace host {

/// From now on SIGINT, SIGTERM and, unless it is ignored already (nohup), SIGHUP set the flag; a
/// reader that goes away (SIGPIPE) and a file that grows too large (SIGXFSZ) are errors of the
/// write alone.
void CatchSignals();

bool Interrupted();

/// Throws a Failure (Interrupted) after Ctrl-C.
void ThrowIfInterrupted();

/// Holds back the signals that set the flag for as long as it lives, so that not even the second
/// Ctrl-C leaves a temporary file behind.
class SignalsHeld {
  public:
    SignalsHeld();
    ~SignalsHeld();
    SignalsHeld(const SignalsHeld&) = delete;
    SignalsHeld& operator=(const SignalsHeld&) = delete;

  private:
    sigset_t before_;
};

}  // namespace host
