// PeripheralReset: the three software reset registers. A system reset by the debug port stops the
// peripherals, the flash controller among them, in the middle of whatever they did. They work again
// when each register has held all of its peripherals in reset for a while and let go of them.
//
// For each register: idle; pending (after a system reset); held (since some time). Only a hold that
// was long enough ends pending, and whatever is held doesn't work.

#pragma once

#include <array>
#include <chrono>
#include <cstddef>
#include <cstdint>

namespace target {

class PeripheralReset {
  public:
    using Time = std::chrono::nanoseconds;

    /// A system reset; `full` when it reaches the peripherals.
    void Reset(bool full, Time now);

    /// What the boot ROM does on its way to the program in flash.
    void Finish() { registers_ = {}; }

    /// A write of the register of that index, 0 to 2. False when it came too soon after the reset
    /// and is lost.
    bool Write(std::size_t index, std::uint32_t value, Time now);

    /// Whether all peripherals work.
    bool IsDone() const;

  private:
    struct Register {
        bool pending = false;
        bool held = false;
        Time since{0};  ///< held
    };
    std::array<Register, 3> registers_;
    Time recovered_{0};  ///< from the last reset
};

}  // namespace target
