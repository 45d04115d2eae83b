// FlashController: erases sectors or the whole flash and makes user registers permanent, one
// command at a time, each under a write key and each taking its time.
//
// It is idle or at work on one command. Words that reach it too soon after the last one are lost,
// and so is a command for which the device isn't ready: it stays idle then, which its status
// doesn't tell from a command that has ended. After an erase it is left in its erase mode until a
// reset, so that nothing can be programmed.

#pragma once

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>

#include "target/simulated/FlashArray.h"
#include "target/simulated/RegisterFile.h"
#include "target/simulated/Rules.h"
#include "target/simulated/SystemControl.h"
#include "target/simulated/UnsettledErases.h"
#include "target/simulated/options/DeviceOptions.h"

namespace target {

class FlashController {
  public:
    using Time = std::chrono::nanoseconds;

    FlashController(const DeviceOptions& options, RegisterFile& registers, SystemControl& system,
                    FlashArray& flash, RuleLog& rules);

    /// Whether it, and not system control, takes the writes of a register.
    static bool Owns(std::uint32_t address);

    /// A write of a register that it owns.
    void Write(std::uint32_t address, std::uint32_t value, CoreState core, Time now);

    /// What the flash command register reads: the bit of the command at work, once it shows.
    std::uint32_t Status(Time now) const {
        return IsHidden(now) ? 0 : running_ ? running_->bit : 0;
    }

    /// The same for somebody who goes by it, which is against the rules before it shows.
    std::uint32_t ReadStatus(Time now) const;
    bool IsBusy() const { return running_.has_value(); }

    /// Ends the command whose time is up, unless a fault keeps it going.
    void AdvanceTo(Time now);

    /// A reset, in the middle of a command or not. An erase leaves the first half of its range
    /// erased (in whole KiB) and the rest as it was; a commit leaves the old value.
    void Reset();

    /// What keeps the loader from programming that range from now on; nothing when nothing does.
    /// Flash that hasn't settled since its erase is not erased afterwards.
    std::optional<Obstacle> PrepareToProgram(std::uint32_t address, std::uint32_t sizeBytes,
                                             Time now);

  private:
    struct Running {
        std::uint32_t bit;
        std::uint32_t address;
        std::uint32_t sizeBytes;  ///< of the range to erase; 0 for a commit
        Time start;
        Time end;
    };

    bool IsHidden(Time now) const;
    void WriteAddress(std::uint32_t value, Time now);
    void WriteBlocks(std::uint32_t address, std::uint32_t value, Time now);
    void Command(std::uint32_t value, CoreState core, Time now);
    bool TakesKey(std::uint32_t key) const;
    std::optional<Obstacle> WhyCommandIsLost(std::uint32_t bit, Time now) const;
    Running SectorErase(Time now) const;
    Running MassErase(Time now) const;
    Running Commit(Time now) const;
    bool IsBank(std::uint32_t address) const;
    bool BlocksBeyondFlashAreEnabled() const;
    bool IsBlockEnabled(std::uint32_t address) const;
    void EraseEnabledBlocks(const Running& erase, Time now);

    const DeviceOptions& options_;
    RegisterFile& registers_;
    SystemControl& system_;
    FlashArray& flash_;
    RuleLog& rules_;
    UnsettledErases unsettled_;
    std::optional<Running> running_;
    bool inEraseMode_ = false;
    std::optional<Time> sectorErased_;    ///< when the last one ended, if no reset came after it
    std::optional<Time> addressWritten_;  ///< since the last reset
    Time blocksReady_{0};                 ///< when the flash block registers take the next word
};

}  // namespace target
