// Adding up the time and the bytes of each phase, and telling the reporter.

#include "host/output/WorkMeter.h"

#include <algorithm>

namespace host {

void WorkMeter::Expect(Phase phase, std::uint64_t bytes) {
    phases_[phase].totalBytes += bytes;
}

void WorkMeter::Begin(Phase phase) {
    TakeTime();
    current_ = phase;
    since_ = Clock::now();
    if (simulatedNow_) simulatedSince_ = simulatedNow_();
    reporter_.Progress(phase, phases_[phase]);
}

void WorkMeter::Advance(std::uint64_t bytes) {
    if (!current_) return;
    TakeTime();
    PhaseProgress& progress = phases_[*current_];
    progress.doneBytes += bytes;
    // More work than was announced: the total grows with it rather than be wrong.
    if (progress.totalBytes != 0)
        progress.totalBytes = std::max(progress.totalBytes, progress.doneBytes);
    reporter_.Progress(*current_, progress);
}

void WorkMeter::End() {
    TakeTime();
    current_.reset();
}

void WorkMeter::TakeTime() {
    if (!current_) return;
    const auto now = Clock::now();
    phases_[*current_].seconds += std::chrono::duration<double>(now - since_).count();
    since_ = now;
    if (!simulatedNow_) return;
    const auto simulated = simulatedNow_();
    std::optional<double>& seconds = phases_[*current_].simulatedSeconds;
    seconds =
        seconds.value_or(0) + std::chrono::duration<double>(simulated - simulatedSince_).count();
    simulatedSince_ = simulated;
}

}  // namespace host
