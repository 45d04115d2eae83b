// Loader: the flash loader as it runs on the target. It works on its own while the debugger goes
// on, and shares with it nothing but two buffers and two parameter blocks in RAM.

#pragma once

#include <chrono>
#include <cstdint>
#include <optional>

#include "target/simulated/FlashArray.h"
#include "target/simulated/FlashController.h"
#include "target/simulated/Ram.h"
#include "target/simulated/Rules.h"
#include "target/simulated/options/DeviceOptions.h"

namespace target {

class Loader {
  public:
    using Time = std::chrono::nanoseconds;

    static constexpr char kFileName[] = "FlashLoaderMerrow.out";
    static constexpr std::uint32_t kChunkMax = 2048;  ///< bytes

    Loader(const DeviceOptions& options, Ram& ram, FlashArray& flash, FlashController& controller,
           RuleLog& rules);

    /// Enters the program at its start: both status words become 0 (idle) at once, and block 0
    /// is served first, then the two in turn.
    void Start();

    /// The core was halted. Of a chunk at work, the first half has been programmed and its status
    /// stays; unless Continue follows, nobody goes on with it.
    void Stop();

    /// The halted core goes on where it was.
    void Continue(Time now);

    /// The core was reset: there is nothing to go on with.
    void Forget();

    /// Does what the loader has got done by `now`.
    void AdvanceTo(Time now);

    /// Whether it programs flash at the moment, so that flash can't be read.
    bool IsProgramming() const { return running_ && chunk_.has_value(); }

    /// Whether a write there would change a chunk that was handed over and isn't finished.
    bool Owns(std::uint32_t address, std::uint64_t sizeBytes);

    Time BusyTime() const { return busyTime_; }

  private:
    struct Chunk {
        std::uint32_t flashAddress;
        std::uint32_t sizeBytes;
        Time end;
        bool lost;  ///< flash wasn't ready for it
    };

    bool StartChunk(Time start);
    void FinishChunk();
    bool IsLost(std::uint32_t address, std::uint32_t sizeBytes, Time start);
    void ProgramFromBuffer(std::uint32_t sizeBytes);

    const DeviceOptions& options_;
    Ram& ram_;
    FlashArray& flash_;
    FlashController& controller_;
    RuleLog& rules_;
    bool running_ = false;
    bool halted_ = false;         ///< in the middle of its work
    Time now_{0};                 ///< when it was last brought up to date
    std::uint32_t block_ = 0;     ///< served now or next: 0 or 1
    std::optional<Chunk> chunk_;  ///< at work
    Time busyTime_{0};
};

}  // namespace target
