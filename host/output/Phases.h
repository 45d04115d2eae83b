// The kinds of work that take their time, and how far each of them has come.

#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>

namespace host {

enum class Phase { Look, Erase, BlankCheck, Program, Checksum, Read, Verify };

struct PhaseName {
    const char* id;       ///< in JSON lines
    const char* running;  ///< beside a progress bar
    const char* done;     ///< in a summary
};

inline constexpr std::array<PhaseName, 7> kPhaseNames{{
    {"look", "Looking", "Looked at"},
    {"erase", "Erasing", "Erased"},
    {"blank-check", "Blank check", "Blank-checked"},
    {"program", "Programming", "Written"},
    {"checksum", "Checksum", "Checksummed"},
    {"read", "Reading", "Read"},
    {"verify", "Verifying", "Compared"},
}};

constexpr const PhaseName& Name(Phase phase) {
    return kPhaseNames[static_cast<std::size_t>(phase)];
}

struct PhaseProgress {
    std::uint64_t doneBytes = 0;
    std::uint64_t totalBytes = 0;  ///< 0 until the phase is expected
    double seconds = 0;
    std::optional<double> simulatedSeconds = {};  ///< of a target that simulates its time

    unsigned Percent() const {
        return totalBytes == 0 ? 0 : static_cast<unsigned>(doneBytes * 100 / totalBytes);
    }

    bool operator==(const PhaseProgress&) const = default;
};

/// How far each phase of a run has come.
class PhaseRecord {
  public:
    const PhaseProgress& operator[](Phase phase) const {
        return all_[static_cast<std::size_t>(phase)];
    }
    PhaseProgress& operator[](Phase phase) { return all_[static_cast<std::size_t>(phase)]; }

  private:
    std::array<PhaseProgress, kPhaseNames.size()> all_{};
};

}  // namespace host
