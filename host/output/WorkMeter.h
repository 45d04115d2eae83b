// The bytes and the time of each phase of a run, as they go by.

#pragma once

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

    /// Announces work to come, so that its total is known before it starts.
    void Expect(Phase phase, std::uint64_t bytes);

    void Begin(Phase phase);

    /// Bytes of the running phase; without one they don't count.
    void Advance(std::uint64_t bytes);
    void End();

    /// Why nothing seems to go on.
    void Say(const std::string& text) { reporter_.Say(Verbosity::Normal, text); }

    std::optional<Phase> Running() const { return current_; }
    const PhaseRecord& Phases() const { return phases_; }

  private:
    using Clock = std::chrono::steady_clock;

    void TakeTime();

    Reporter& reporter_;
    PhaseRecord phases_;
    std::optional<Phase> current_;
    Clock::time_point since_;
    std::function<std::chrono::nanoseconds()> simulatedNow_;
    std::chrono::nanoseconds simulatedSince_{0};
};

}  // namespace host
