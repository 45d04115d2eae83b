// How progress is drawn: a bar on a terminal, a line every ten percent, or not at all.

#pragma once

#include <chrono>
#include <cstdio>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <utility>

#include "host/output/Phases.h"

namespace host {

enum class ProgressStyle { None, Plain, Bar };

/// "auto" is a bar where the stream is a terminal that can draw one, plain lines on a terminal
/// that can't, nothing elsewhere.
ProgressStyle ChooseStyle(const std::string& option, std::FILE* stream);

/// One line of at most `columns` characters; a narrow one leaves out what matters least.
std::string BarLine(Phase phase, const PhaseProgress& progress, std::size_t columns);

/// What removes a line of so many characters. A terminal that was made narrower since has broken it
/// into several.
std::string Erasure(std::size_t drawnColumns, std::size_t columns);

/// Holds updates back to ten a second for each phase, the first and the completing one excepted,
/// and lets no phase run backwards.
class UpdateGate {
  public:
    using Time = std::chrono::steady_clock::time_point;

    bool Passes(Phase phase, const PhaseProgress& progress, Time now);

  private:
    struct Last {
        Time time;
        PhaseProgress progress;
    };
    std::map<Phase, Last> last_;
};

class ProgressDisplay {
  public:
    using Writer = std::function<void(const std::string&)>;

    /// Draws by `write`, on the screen behind `stream`.
    ProgressDisplay(ProgressStyle style, std::FILE* stream, Writer write)
        : style_(style), stream_(stream), write_(std::move(write)) {}

    /// To be called for every step: a line for each ten percent that were passed.
    void DrawPlain(Phase phase, const PhaseProgress& progress);

    /// To be called at a pace that people can follow.
    void DrawBar(Phase phase, const PhaseProgress& progress);

    /// Takes the bar off the screen, so that a line can be written in its place.
    void Clear();

  private:
    ProgressStyle style_;
    std::FILE* stream_;
    Writer write_;
    std::size_t drawnColumns_ = 0;  ///< of the line that stands there; 0: none
    std::map<Phase, unsigned> nextPercent_;
};

}  // namespace host
