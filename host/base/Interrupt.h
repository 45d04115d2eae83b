// Ctrl-C as a flag. The first one is only remembered, so that the work can end in order; the next
// one, unless it comes with the first, ends the process at once.

#pragma once

#include <signal.h>

#include <functional>

namespace host {

/// From now on SIGINT, SIGTERM and, unless it is ignored already (nohup), SIGHUP set the flag; a
/// reader that goes away (SIGPIPE) and a file that grows too large (SIGXFSZ) are errors of the
/// write alone.
void CatchSignals();

/// Also while an InterruptSource has said so.
bool Interrupted();

/// Lets somebody else than the user at the keyboard interrupt the work for as long as it lives.
/// There is one at a time.
class InterruptSource {
  public:
    /// `asked` is called by Interrupted, again and again, until it is true once.
    explicit InterruptSource(std::function<bool()> asked);
    ~InterruptSource();
    InterruptSource(const InterruptSource&) = delete;
    InterruptSource& operator=(const InterruptSource&) = delete;

    bool HasInterrupted();

  private:
    const std::function<bool()> asked_;
    bool interrupted_ = false;
    bool asking_ = false;
};

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
