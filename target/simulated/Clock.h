// Clock: where the simulated device learns how much real time has gone by. A host that waits on
// its own, without telling the target, must find the target further on when it comes back.

#pragma once

#include <chrono>

namespace target {

class Clock {
  public:
    virtual ~Clock() = default;

    /// Time since an arbitrary but fixed moment; never runs backwards.
    virtual std::chrono::nanoseconds Now() = 0;
};

/// The machine's monotonic clock: a host's wait of 100 ms is 100 ms for the target.
class SteadyClock final : public Clock {
  public:
    std::chrono::nanoseconds Now() override {
        return std::chrono::steady_clock::now().time_since_epoch();
    }
};

/// A clock that stands still until it is told to move on, so that a run repeats exactly.
class ManualClock final : public Clock {
  public:
    std::chrono::nanoseconds Now() override { return now_; }
    void Advance(std::chrono::nanoseconds step) { now_ += step; }

  private:
    std::chrono::nanoseconds now_{0};
};

}  // namespace target
