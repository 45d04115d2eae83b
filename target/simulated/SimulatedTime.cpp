// How simulated time moves: link, pauses, injected clock. Everything is clamped, so that no client
// can wait it into an overflow.

#include "target/simulated/SimulatedTime.h"

#include <algorithm>

namespace target {

namespace {

using std::chrono::nanoseconds;

// A third of the range, so that the three shares together fit.
constexpr nanoseconds kShareMax = nanoseconds::max() / 3;

void Add(nanoseconds& share, nanoseconds step) {
    share += std::clamp(step, nanoseconds(0), kShareMax - share);
}

nanoseconds TransferTime(std::uint64_t bytes, std::uint64_t bytesPerSecond) {
    if (bytesPerSecond == 0) return nanoseconds(0);
    constexpr std::uint64_t kNanosecondsPerSecond = 1'000'000'000;
    // An access is below 2^32 bytes, so the product is below 2^62.
    return nanoseconds(bytes * kNanosecondsPerSecond / bytesPerSecond);
}

}  // namespace

SimulatedTime::SimulatedTime(const Timings& timings, Clock* clock)
    : latency_(timings.latency),
      bytesPerSecond_(timings.bytesPerSecond),
      clock_(clock == nullptr ? &ownClock_ : clock),
      clockStart_(clock_->Now()) {}

void SimulatedTime::AddAccess(std::uint64_t bytes) {
    Add(link_, latency_ + TransferTime(bytes, bytesPerSecond_));
}

void SimulatedTime::AddPause(nanoseconds pause) {
    Add(pauses_, pause);
}

TimeSpent SimulatedTime::Spent() const {
    const nanoseconds elapsed = std::max(clock_->Now() - clockStart_, nanoseconds(0));
    return {link_, pauses_, std::min(elapsed, kShareMax)};
}

nanoseconds SimulatedTime::Now() const {
    const TimeSpent spent = Spent();
    return spent.link + spent.pauses + spent.clock;
}

}  // namespace target
