// What the system tells a process: that its user has had enough.

#pragma once

#include <memory>

namespace base {

/// From now on SIGINT, SIGTERM and, unless it is ignored already (nohup), SIGHUP are remembered.
/// The next one, unless it comes with the first, ends the process at once. A reader that goes away
/// (SIGPIPE) and a file that grows too large (SIGXFSZ) are errors of the write alone.
void CatchSignals();

/// Whether one has come.
bool HasCaughtSignal();

/// Holds back the signals that are caught for as long as it lives, so that not even the second one
/// leaves a temporary file behind.
class SignalsHeld {
  public:
    SignalsHeld();
    ~SignalsHeld();
    SignalsHeld(const SignalsHeld&) = delete;
    SignalsHeld& operator=(const SignalsHeld&) = delete;

  private:
    struct Before;
    std::unique_ptr<Before> before_;
};

}  // namespace base
