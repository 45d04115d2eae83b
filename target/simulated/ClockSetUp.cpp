// What a word in the clock configuration register stands for, and which stage it leads to.

#include "target/simulated/ClockSetUp.h"

namespace target {

namespace {

using Stage = ClockSetUp::Stage;

constexpr std::uint32_t kUseDivider = 0x00400000;
constexpr std::uint32_t kBypass = 0x00000800;

// A setting: the bits of its fields, and what they must hold.
struct Setting {
    std::uint32_t mask;
    std::uint32_t value;

    bool IsIn(std::uint32_t word) const { return (word & mask) == value; }
};

// Both oscillators on, the main one at its crystal, the PLL down and bypassed.
constexpr Setting kSource = {0x00400073 | 0x00003B80, 0x00003B80};
// The internal oscillator off, the main one divided by sixteen as soon as the divider is used.
constexpr Setting kDivider = {0x005E0073 | 0x07803B82, 0x07803B82};

// Whatever no setting names is trimmed in the factory.
constexpr std::uint32_t kTrim = ~(kSource.mask | kDivider.mask | kUseDivider | kBypass);

}  // namespace

void ClockSetUp::Configure(std::uint32_t previous, std::uint32_t value) {
    const bool repeats = value == previous;
    const bool keepsTrim = ((previous ^ value) & kTrim) == 0;
    if (stage_ == Stage::SourceAsked && repeats) {
        stage_ = Stage::SourceTaken;
    } else if (stage_ == Stage::DividerAsked && repeats) {
        stage_ = Stage::Set;
    } else if (stage_ == Stage::Unlocked && keepsTrim && kSource.IsIn(value)) {
        stage_ = Stage::SourceAsked;
    } else if (stage_ == Stage::SourceTaken && keepsTrim && kDivider.IsIn(value)) {
        stage_ = Stage::DividerAsked;
    } else if (value == ((previous & ~kUseDivider) | kBypass)) {
        stage_ = Stage::Bypassed;
    } else {
        stage_ = Stage::Unset;
    }
}

// The flag is of the last bypass, and a repeated word is one as well. Cleared at any other time it
// says nothing of the bypass to come.
void ClockSetUp::ClearLockFlag() {
    const bool bypassed =
        stage_ == Stage::Bypassed || stage_ == Stage::SourceTaken || stage_ == Stage::Set;
    if (bypassed) stage_ = Stage::Unlocked;
}

}  // namespace target
