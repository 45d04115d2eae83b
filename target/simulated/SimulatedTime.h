// SimulatedTime: the one clock that everything in the simulated device goes by, and the account of
// what made it move.

#pragma once

#include <chrono>
#include <cstdint>

#include "target/simulated/Clock.h"
#include "target/simulated/options/DeviceOptions.h"

namespace target {

/// Shares of the simulated time. They stop growing at about 97 years each.
struct TimeSpent {
    std::chrono::nanoseconds link{0};    ///< latency and transfer of the accesses
    std::chrono::nanoseconds pauses{0};  ///< asked for by whoever drives the target
    std::chrono::nanoseconds clock{0};   ///< went by on the injected clock
};

class SimulatedTime {
  public:
    SimulatedTime(const Timings& timings, Clock* clock);

    void AddAccess(std::uint64_t bytes);
    void AddPause(std::chrono::nanoseconds pause);

    TimeSpent Spent() const;
    std::chrono::nanoseconds Now() const;

  private:
    const std::chrono::nanoseconds latency_;
    const std::uint64_t bytesPerSecond_;
    mutable SteadyClock ownClock_;
    Clock* const clock_;
    const std::chrono::nanoseconds clockStart_;
    std::chrono::nanoseconds link_{0};
    std::chrono::nanoseconds pauses_{0};
};

}  // namespace target
