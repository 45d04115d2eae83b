// The bytes and the time of each phase of a run, as they go by.

#pragma once

#include <array>
#include <chrono>
#include <cstdint>
#include <optional>

#include "host/output/Phases.h"
#include "host/output/Reporter.h"

namespace host {

class WorkMeter {
  public:
    explicit WorkMeter(Reporter& reporter) : reporter_(reporter) {}

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
};

}  // namespace host
