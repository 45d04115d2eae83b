// DebugPort: an ARM JTAG debug port. Its test access port is a state machine that TMS drives, with
// shift registers between TDI and TDO; behind these are its registers and their errors, which
// stick: once an access has failed, all that follow are dropped until the error is cleared.

#pragma once

#include <cstdint>

#include "tests/probe/AccessPort.h"

namespace probe {

class DebugPort {
  public:
    explicit DebugPort(AccessPort& port) : port_(port) {}

    /// A rising edge of TCK.
    void Clock(bool tms, bool tdi);

    /// Between two edges. Pulled up while nothing is shifted.
    bool Tdo() const;

    void Reset() { state_ = State::TestLogicReset; }

  private:
    /// From Select on, of the scan of the instruction or of the data.
    enum class State {
        TestLogicReset,
        RunTestIdle,
        Select,
        Capture,
        Shift,
        Exit1,
        Pause,
        Exit2,
        Update
    };
    static const State kNext[][2];

    void Capture();
    void Update();
    void Load(std::uint64_t value, unsigned lengthBits);

    /// Accesses to a register of this port, or of the access port that is selected; `reg` is its
    /// offset in a bank of four.
    void AccessItself(bool reads, unsigned reg, std::uint32_t data);
    void AccessPortBehind(bool reads, unsigned reg, std::uint32_t data);
    std::uint32_t Status() const;
    void SetStatus(std::uint32_t value);

    AccessPort& port_;
    State state_ = State::TestLogicReset;
    bool scansInstruction_ = false;
    std::uint32_t instruction_ = 0;
    std::uint64_t shift_ = 0;
    unsigned lengthBits_ = 1;
    std::uint32_t select_ = 0;
    std::uint32_t power_ = 0;
    bool failed_ = false;
    std::uint32_t result_ = 0;  ///< of the last read
};

}  // namespace probe
