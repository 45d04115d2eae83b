// The bytes and the time of each phase of a run, as they go by.

#pragma once

#include <array>
#include <chrono>
#include <cstdint>
#include <functional>
#include <optional>

#include "host/output/Phases.h"
#include "host/output/Reporter.h"

namespace host {

class WorkMeter {
  public:
    explicit WorkMeter(Reporter& reporter) : reporter_(reporter) {}

    /// The time of a target that simulates it; the phases then have that as well.
    void SetSimulatedClock(std::function<std::chrono::nanoseconds()> now) {
        simulatedNow_ = std::move(now);
    }
    bool SimulatesTime() const { return simulatedNow_ != nullptr; }

    /// Announces work to come, so that its total is known before it starts.
    void Expect(Phase phase, std::uint64_t bytes);

    void Begin(Phase phase);

    /// Bytes of the running phase; without one they don't count.
    void Advance(std::uint64_t bytes);
    void End();

    std::optional<Phase> Running() const { return current_; }
    const PhaseProgress& Of(Phase phase) const { return phases_[static_cast<std::size_t>(phase)]; }

  private:
    using Clock = std::chrono::steady_clock;

    PhaseProgress& At(Phase phase) { return phases_[static_cast<std::size_t>(phase)]; }
    void TakeTime();

    Reporter& reporter_;
    std::array<PhaseProgress, kPhaseNames.size()> phases_{};
    std::optional<Phase> current_;
    Clock::time_point since_;
    std::function<std::chrono::nanoseconds()> simulatedNow_;
    std::chrono::nanoseconds simulatedSince_{0};
};

}  // namespace host
