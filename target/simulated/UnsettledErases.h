// UnsettledErases: flash that was erased a moment ago. An erased cell reads as erased at once, but
// holds it only when it was left alone for a while: programmed before, it is what it was.

#pragma once

#include <chrono>
#include <cstdint>
#include <deque>

#include "target/simulated/FlashArray.h"

namespace target {

class UnsettledErases {
  public:
    using Time = std::chrono::nanoseconds;

    explicit UnsettledErases(FlashArray& flash) : flash_(flash) {}

    /// Erases a range, in whole pages.
    void Erase(std::uint32_t address, std::uint32_t sizeBytes, Time now);

    /// Brings back what the pages of a range held that were erased too short a time before `now`.
    /// Whether there were such.
    bool Undo(std::uint32_t address, std::uint32_t sizeBytes, Time now);

  private:
    struct Entry {
        Time settled;
        FlashArray::HeldPages pages;
    };
    void ForgetSettled(Time now);

    FlashArray& flash_;
    std::deque<Entry> entries_;  ///< in the order of time
};

}  // namespace target
