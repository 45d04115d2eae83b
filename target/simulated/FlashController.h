// FlashController: erases sectors or the whole flash and makes user registers permanent, one
// command at a time, each under a write key and each taking its time.

#pragma once

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>

#include "target/simulated/FlashArray.h"
#include "target/simulated/RegisterFile.h"
#include "target/simulated/Rules.h"
#include "target/simulated/options/DeviceOptions.h"

namespace target {

class FlashController {
  public:
    using Time = std::chrono::nanoseconds;

    FlashController(const DeviceOptions& options, RegisterFile& registers, FlashArray& flash,
                    RuleLog& rules);

    /// A write of the flash command register: key in bits 31 to 16, one command bit below. What
    /// it works on stands in the flash address register. A wrong key does nothing.
    void Command(std::uint32_t value, bool coreRunning, Time now);

    /// What the flash command register reads: the bit of the command at work.
    std::uint32_t Status() const { return running_ ? running_->bit : 0; }
    bool IsBusy() const { return running_.has_value(); }

    /// Ends the command whose time is up, unless a fault keeps it going.
    void AdvanceTo(Time now);

    /// A reset in the middle of a command. An erase leaves the first half of its range erased (in
    /// whole KiB) and the rest as it was; a commit leaves the old value.
    void Abort();

  private:
    struct Running {
        std::uint32_t bit;
        std::uint32_t address;
        std::uint32_t sizeBytes;  ///< of the range to erase; 0 for a commit
        Time end;
    };

    bool TakesKey(std::uint32_t key) const;
    Running SectorErase(Time now) const;
    Running MassErase(Time now) const;
    Running Commit(Time now) const;
    bool BlocksBeyondFlashAreEnabled() const;

    const DeviceOptions& options_;
    RegisterFile& registers_;
    FlashArray& flash_;
    RuleLog& rules_;
    std::optional<Running> running_;
};

}  // namespace target
