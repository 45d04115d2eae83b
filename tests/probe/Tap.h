// Tap: the test access port of a JTAG debug port: a state machine that TMS drives, and shift
// registers between TDI and TDO.

#pragma once

#include <cstdint>

#include "tests/probe/DebugPort.h"

namespace probe {

class Tap {
  public:
    explicit Tap(DebugPort& port) : port_(port) {}

    /// A rising edge of TCK.
    void Clock(bool tms, bool tdi);

    /// Between two edges. Pulled up while nothing is shifted.
    bool Tdo() const;

    void Reset() { state_ = State::TestLogicReset; }

  private:
    enum class State {
        TestLogicReset,
        RunTestIdle,
        SelectDr,
        CaptureDr,
        ShiftDr,
        Exit1Dr,
        PauseDr,
        Exit2Dr,
        UpdateDr,
        SelectIr,
        CaptureIr,
        ShiftIr,
        Exit1Ir,
        PauseIr,
        Exit2Ir,
        UpdateIr
    };
    static const State kNext[][2];

    void Capture();
    void Update();
    void Load(std::uint64_t value, unsigned lengthBits);

    DebugPort& port_;
    State state_ = State::TestLogicReset;
    std::uint32_t instruction_ = 0;
    std::uint64_t shift_ = 0;
    unsigned lengthBits_ = 1;
};

}  // namespace probe
