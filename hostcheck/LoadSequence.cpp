#include "hostcheck/LoadSequence.h"

#include <utility>

namespace hostcheck {

namespace {

constexpr std::int32_t kTargetWillRun = 1;
constexpr std::int32_t kLoadEnds = 2;

}  // namespace

// Whatever the mode, the device forgets what it has erased: sections that come then are erased for
// again, and with them what the sections before have in the same sectors.
std::string LoadSequence::Reset(std::int32_t mode) {
    const State before = std::exchange(state_, State::Nothing);
    if (mode == kLoadEnds) {
        completed_ = completed_ || before == State::Sections;
        return "";
    }
    if (mode != kTargetWillRun) state_ = State::Begun;
    return before == State::Sections ? "2 after the last section" : "";
}

std::string LoadSequence::Section() {
    return std::exchange(state_, State::Sections) == State::Nothing
               ? "ResetSettings(0) before the first section"
               : "";
}

}  // namespace hostcheck
