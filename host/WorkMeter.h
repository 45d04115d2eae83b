// Follows the work that goes by in the host's slots. The plug-in reports progress for what it reads
// back only; sectors erased and chunks programmed are seen in its accesses, so that each phase has
// its bytes and its time.

#pragma once

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>

#include "host/Phases.h"
#include "host/Reporter.h"

namespace host {

/// A byte that a blank check has found not to be erased.
struct NotBlank {
    std::uint32_t address = 0;
    std::uint8_t actual = 0;
};

class WorkMeter {
  public:
    explicit WorkMeter(Reporter& reporter) : reporter_(reporter) {}

    void SetGeometry(std::uint64_t flashSize, std::uint32_t sectorSize);

    /// Announces work to come, so that its total is known before it starts.
    void Expect(Phase phase, std::uint64_t bytes);

    // What the plug-in does, told by the host's slots.
    void ProgramLoaded();
    void Wrote(std::uint32_t address, std::size_t bytes, std::uint32_t word);
    void Read(std::uint32_t address, std::size_t bytes, const std::uint8_t* data);
    void DisplayBegan(const std::string& title);
    void DisplayEnded();

    // What the host does on its own account.
    void Begin(Phase phase);
    void Advance(std::uint64_t bytes);
    void End();

    const PhaseProgress& Of(Phase phase) const { return At(phase); }
    const std::optional<NotBlank>& FirstNotBlank() const { return notBlank_; }

    /// Whether anything was begun that changes flash.
    bool FlashTouched() const { return flashTouched_; }

    /// The same, or a user register was committed: what the device keeps without power may differ.
    bool ContentsTouched() const { return contentsTouched_; }

  private:
    using Clock = std::chrono::steady_clock;

    const PhaseProgress& At(Phase phase) const { return phases_[static_cast<std::size_t>(phase)]; }
    PhaseProgress& At(Phase phase) { return phases_[static_cast<std::size_t>(phase)]; }
    void BeginErase(std::uint32_t command);
    void FinishErase(std::uint32_t commandRegister);
    void TakeTime();

    Reporter& reporter_;
    std::array<PhaseProgress, kPhaseNames.size()> phases_{};
    std::optional<Phase> current_;
    Clock::time_point since_;
    std::uint64_t flashSize_ = 0;
    std::uint32_t sectorSize_ = 0;
    std::uint32_t pendingErase_ = 0;  ///< command bits of an erase that is under way
    bool displayOpen_ = false;
    bool flashTouched_ = false;
    bool contentsTouched_ = false;
    std::optional<NotBlank> notBlank_;
};

}  // namespace host
