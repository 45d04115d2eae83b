// Virtual time for a whole test process: local sleeps return at once and move the monotonic clock
// on instead, so that waits of seconds cost nothing and every run repeats exactly. Linking
// VirtualTime.cpp is what puts it in force; the loaded plug-in's sleeps are caught as well. A wait
// for another thread's bytes (poll) lasts its whole virtual time soon after they fail to come.

#pragma once

#include <chrono>

#include "target/simulated/Clock.h"

namespace test {

std::chrono::nanoseconds VirtualNow();

/// The same time for a simulated device.
class VirtualClock final : public target::Clock {
  public:
    std::chrono::nanoseconds Now() override { return VirtualNow(); }
};

}  // namespace test
