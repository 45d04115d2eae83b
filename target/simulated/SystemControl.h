// SystemControl: what lies around the flash controller and has to be right before flash can be
// erased or programmed: its timing, the clock, the peripherals' resets, the fix-ups of two classes,
// and the ROM that lies over the flash after a reset.
//
// Timing, clock and fix-ups are made once and last until power goes; a reset by the debug port
// doesn't touch them. The ROM comes back with each reset and is left by whoever writes it away, or
// by the boot ROM itself when it hands over to the program in flash.

#pragma once

#include <chrono>
#include <cstdint>
#include <optional>

#include "target/simulated/ClockSetUp.h"
#include "target/simulated/PeripheralReset.h"
#include "target/simulated/RegisterFile.h"
#include "target/simulated/Rules.h"
#include "target/simulated/options/DeviceOptions.h"

namespace target {

/// What the core does. The loader runs in RAM, everything else that runs fetches from flash.
enum class CoreState { Halted, RunsLoader, RunsFlash };

/// A rule that keeps flash from being worked on, and what is wrong, as the end of a sentence.
struct Obstacle {
    const char* rule;
    const char* why;
};

class SystemControl {
  public:
    using Time = std::chrono::nanoseconds;

    /// The ROM covers the flash up to here.
    static constexpr std::uint32_t kRomSizeBytes = 32 * 1024;
    static constexpr std::uint8_t kRomByte = 0x5A;

    SystemControl(const DeviceOptions& options, RegisterFile& registers, RuleLog& rules);

    /// Any register but those of the flash controller. A write that comes at the wrong time is
    /// lost, which only the log of the rules shows.
    void Write(std::uint32_t address, std::uint32_t value, CoreState core, Time now);

    /// Everything is to be set up; the boot ROM has handed over to the program in flash.
    void PowerUp();

    /// A reset by the debug port; `full` when it reaches the peripherals. The registers follow on
    /// their own.
    void Reset(bool full, CoreState core, Time now);

    /// The core leaves the boot ROM for the program in flash.
    void RunBootRom();

    /// Why flash can't be erased or programmed; nothing when it can.
    std::optional<Obstacle> WhyFlashIsNotReady() const;

    /// Whether the clock has been stable for so long that the flash controller takes words.
    bool IsClockStable(Time now) const { return now >= clockStable_; }

    /// Whether the ROM lies over the flash at this address.
    bool IsRomAt(std::uint32_t address, Time now) const;

  private:
    void WriteTiming(std::uint32_t value, CoreState core, Time now);
    void WriteClock(std::uint32_t value, CoreState core, Time now);
    void WriteClock2(std::uint32_t value);
    void WriteRomControl(std::uint32_t value, Time now);
    bool IsTestRegisterLocked() const;

    const bool needsSetUp_;
    const bool needsClockFixUp_;
    RegisterFile& registers_;
    RuleLog& rules_;
    ClockSetUp clock_;
    PeripheralReset peripherals_;
    std::optional<Time> timingWritten_;  ///< none: not since power-up, or lost again
    bool overrideCleared_ = false;       ///< first half of the clock fix-up
    bool clockFixed_ = false;            ///< all of it
    bool fetchCut_ = false;              ///< by a reset under a running core, until the next one
    Time clockStable_{0};
    Time romGone_{0};
};

}  // namespace target
