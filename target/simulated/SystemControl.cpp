// One function for each register whose writes do more than to be stored.

#include "target/simulated/SystemControl.h"

#include <fmt/format.h>

#include "target/simulated/options/DeviceClass.h"

namespace target {

namespace {

using namespace std::chrono_literals;

// Each a little less than what drivers allow for: a pause that is half as long must not do.
constexpr std::chrono::nanoseconds kTimingSetUp = 16ms;    // before the clock may be switched
constexpr std::chrono::nanoseconds kClockSettling = 16ms;  // after it was switched
constexpr std::chrono::nanoseconds kRomLeaving = 8ms;      // until the flash shows

constexpr std::uint32_t kLockFlag = 0x00000040;
constexpr std::uint32_t kClockOverride = 0x80000000;
constexpr std::uint32_t kFixedClock = 0x078E3AD1;  // the whole word, by the list of errata
constexpr std::uint32_t kTestUnlocked = 3;
constexpr std::uint32_t kRomMapped = 1;

}  // namespace

SystemControl::SystemControl(const DeviceOptions& options, RegisterFile& registers, RuleLog& rules)
    : needsSetUp_(NeedsFlashSetUp(options)),
      needsClockFixUp_(NeedsClockFixUp(options)),
      registers_(registers),
      rules_(rules) {}

// A register that a class lacks is refused by the register file in any case, before or after the
// effect. So an effect must do no harm on a class without the register.
void SystemControl::Write(std::uint32_t address, std::uint32_t value, CoreState core, Time now) {
    switch (address) {
        case reg::kFlashTiming:
            return WriteTiming(value, core, now);
        case reg::kClock:
            return WriteClock(value, core, now);
        case reg::kClock2:
            return WriteClock2(value);
        case reg::kRomControl:
            return WriteRomControl(value, now);
        case reg::kClockStatus:
            registers_.Write(address, value);
            if ((value & kLockFlag) != 0) clock_.ClearLockFlag();
            return;
        case reg::kTestControl:
            if (registers_.Has(address) && IsTestRegisterLocked()) {
                return rules_.Record(rule::kFixUp,
                                     fmt::format("Write of {:#x} ignored: it is locked", address));
            }
            return registers_.Write(address, value);
        // Words of the watchdogs alone are never lost: they are on a clock of their own.
        case reg::kSoftwareReset0:
        case reg::kSoftwareReset0 + 4:
        case reg::kSoftwareReset0 + 8:
            if (!peripherals_.Write((address - reg::kSoftwareReset0) / 4, value, now)) {
                return rules_.Record(
                    rule::kResetRecovery,
                    fmt::format("Write of {:#x} lost: it came too soon after a reset", address));
            }
            return registers_.Write(address, value);
        default:
            return registers_.Write(address, value);
    }
}

// The program in flash is fetched by this timing.
void SystemControl::WriteTiming(std::uint32_t value, CoreState core, Time now) {
    if (core == CoreState::RunsFlash && registers_.Has(reg::kFlashTiming)) {
        return rules_.Record(rule::kHaltedForTiming,
                             "Flash timing lost: the core is fetching from flash");
    }
    registers_.Write(reg::kFlashTiming, value);
    timingWritten_ = now;
}

void SystemControl::WriteClock(std::uint32_t value, CoreState core, Time now) {
    const std::uint32_t previous = registers_.Read(reg::kClock);
    registers_.Write(reg::kClock, value);
    clockStable_ = now + kClockSettling;
    clockFixed_ = overrideCleared_ && value == kFixedClock;
    if (!needsSetUp_) return;
    clock_.Configure(previous, value);
    // Under a running core the source may go away between two of its instructions.
    if (core != CoreState::Halted) {
        clock_.Lose();
        rules_.Record(rule::kHaltedForClock, "Clock lost: it was switched under a running core");
    }
    // The timing counts clocks, and has to be taken over before these change.
    if (timingWritten_ && now < *timingWritten_ + kTimingSetUp) {
        timingWritten_.reset();
        rules_.Record(rule::kTimingSetUp,
                      "Flash timing lost: the clock was switched too soon after it was written");
    }
}

// Only the override may change: the rest is trimmed in the factory.
void SystemControl::WriteClock2(std::uint32_t value) {
    const std::uint32_t previous = registers_.Read(reg::kClock2);
    registers_.Write(reg::kClock2, value);
    overrideCleared_ = value == (previous & ~kClockOverride);
}

// Writing ones clears them, so a driver writes back what it has read.
void SystemControl::WriteRomControl(std::uint32_t value, Time now) {
    const std::uint32_t previous = registers_.Read(reg::kRomControl);
    registers_.Write(reg::kRomControl, value);
    if (previous != registers_.Read(reg::kRomControl)) romGone_ = now + kRomLeaving;
}

void SystemControl::PowerUp() {
    clock_ = {};
    timingWritten_.reset();
    overrideCleared_ = clockFixed_ = fetchCut_ = false;
    clockStable_ = Time(0);
    RunBootRom();
}

// A cut fetch ends with the next reset that finds the core halted. Timing, clock and fix-ups stay.
void SystemControl::Reset(bool full, CoreState core, Time now) {
    peripherals_.Reset(full, now);
    fetchCut_ = core != CoreState::Halted;
    if (fetchCut_) {
        rules_.Record(rule::kHaltedForReset,
                      "Flash interface stuck: the reset came while the core was running");
    }
}

// It leaves everything as the program in flash expects it.
void SystemControl::RunBootRom() {
    peripherals_.Finish();
    fetchCut_ = false;
    if (registers_.Has(reg::kRomControl)) registers_.Write(reg::kRomControl, kRomMapped);
    romGone_ = Time(0);
}

// One obstacle is enough; they are asked for in the order in which a driver removes them.
std::optional<Obstacle> SystemControl::WhyFlashIsNotReady() const {
    if (needsSetUp_ && !timingWritten_) {
        return Obstacle{rule::kFlashTiming, "its timing has not been written since power-up"};
    }
    if (needsSetUp_ && !clock_.IsSet()) {
        return Obstacle{rule::kClockSetUp, "the clock has not been set up"};
    }
    if (needsClockFixUp_ && !clockFixed_) {
        return Obstacle{rule::kFixUp, "the clock has not been fixed up"};
    }
    if (registers_.Has(reg::kTestControl) &&
        (registers_.Read(reg::kTestControl) != 0 || !IsTestRegisterLocked())) {
        return Obstacle{rule::kFixUp, "its controller has not been fixed up and locked"};
    }
    if (!peripherals_.IsDone()) {
        return Obstacle{rule::kPeripheralReset, "the peripherals have not come out of reset"};
    }
    if (fetchCut_) return Obstacle{rule::kHaltedForReset, "its interface is stuck in a fetch"};
    return std::nullopt;
}

bool SystemControl::IsRomAt(std::uint32_t address, Time now) const {
    if (address >= kRomSizeBytes || !registers_.Has(reg::kRomControl)) return false;
    return (registers_.Read(reg::kRomControl) & kRomMapped) != 0 || now < romGone_;
}

// Only for classes that have the lock; others have no test register to ask for.
bool SystemControl::IsTestRegisterLocked() const {
    return registers_.Read(reg::kTestLock) != kTestUnlocked;
}

}  // namespace target
