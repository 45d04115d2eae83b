// DebugPort: the registers of an ARM JTAG debug port, and its errors, which stick: once an access
// has failed, all that follow are dropped until the error is cleared.

#pragma once

#include <cstdint>

#include "tests/probe/AccessPort.h"

namespace probe {

class DebugPort {
  public:
    static constexpr std::uint32_t kIdentification = 0x4BA00477;
    static constexpr std::uint32_t kDone = 2;  ///< the acknowledgement; nothing here is ever late

    explicit DebugPort(AccessPort& port) : port_(port) {}

    /// What the last read gave.
    std::uint32_t Result() const { return result_; }

    /// An access to a register of this port, or of the access port that is selected; `reg` is its
    /// offset in a bank of four.
    void AccessItself(bool reads, unsigned reg, std::uint32_t data);
    void AccessPortBehind(bool reads, unsigned reg, std::uint32_t data);

  private:
    std::uint32_t Status() const;
    void SetStatus(std::uint32_t value);

    AccessPort& port_;
    std::uint32_t select_ = 0;
    std::uint32_t power_ = 0;
    bool failed_ = false;
    std::uint32_t result_ = 0;
};

}  // namespace probe
