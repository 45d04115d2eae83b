// Virtual time for a whole test process: local sleeps return at once and move the monotonic clock
// on instead, so that waits of seconds cost nothing and every run repeats exactly. Linking
// VirtualTime.cpp is what puts it in force; the loaded plug-in's sleeps are caught as well. A wait
// for another thread's bytes (poll) lasts its whole virtual time soon after they fail to come: that
// is when they aren't there in 5 ms of real time, as on an idle machine they are.

#pragma once

#include <chrono>

#include "target/simulated/Clock.h"

namespace test {

std::chrono::nanoseconds VirtualNow();

/// As long as it lives, other threads have up to a second of real time: for tests that expect an
/// answer to each request, on a machine with other work, too.
class Patience {
  public:
    Patience();
    ~Patience();
    Patience(const Patience&) = delete;
    Patience& operator=(const Patience&) = delete;
};

/// The same time for a simulated device.
class VirtualClock final : public target::Clock {
  public:
    std::chrono::nanoseconds Now() override { return VirtualNow(); }
};

}  // namespace test
