// Pulses of the software reset registers and the times that they take.

#include "target/simulated/PeripheralReset.h"

#include <algorithm>

namespace target {

namespace {

using namespace std::chrono_literals;

constexpr std::chrono::nanoseconds kRecovery = 4ms;    // of the register clock, after a reset
constexpr std::chrono::nanoseconds kPulseWidth = 4ms;  // least

// The watchdogs in register 0 are reset by themselves, at any time.
constexpr std::array<std::uint32_t, 3> kPeripherals = {~0x10000008U, ~0U, ~0U};

}  // namespace

void PeripheralReset::Reset(bool full, Time now) {
    for (Register& entry : registers_)
        entry = {.pending = entry.pending || full};
    recovered_ = now + kRecovery;
}

bool PeripheralReset::Write(std::size_t index, std::uint32_t value, Time now) {
    Register& entry = registers_.at(index);
    const std::uint32_t held = value & kPeripherals.at(index);
    if (now < recovered_ && held != 0) return false;
    if (held == kPeripherals.at(index)) {
        if (!entry.held) entry.since = now;
    } else if (held == 0 && entry.held && now - entry.since >= kPulseWidth) {
        entry.pending = false;
    }
    entry.held = held != 0;
    return true;
}

bool PeripheralReset::IsDone() const {
    return std::none_of(registers_.begin(), registers_.end(),
                        [](const Register& entry) { return entry.pending || entry.held; });
}

}  // namespace target
