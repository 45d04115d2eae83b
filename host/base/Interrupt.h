// Ctrl-C as a flag that is asked for between two steps, so that the work can end in order.

#pragma once

#include <functional>

namespace host {

/// After the first signal that base::CatchSignals remembers. Also while an InterruptSource has said
/// so.
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

}  // namespace host
