// Core: what an ARMv7-M core shows a debugger: its debug registers, its exceptions as far as they
// stop it, and through its bus the memory of the simulated device, whose loader it runs.

#pragma once

#include <chrono>
#include <cstdint>
#include <optional>

#include "target/simulated/ServedSimulation.h"
#include "tests/probe/AccessPort.h"

namespace probe {

/// What silicon, board or firmware may do to a debugger.
struct CoreFaults {
    std::chrono::milliseconds resetTime{0};                 ///< how long a reset lasts
    std::optional<std::chrono::milliseconds> crashesAfter;  ///< a program that was started in RAM
    bool neverHalts = false;
};

class Core final : public Bus {
  public:
    Core(target::ServedSimulation& device, const CoreFaults& faults);

    std::uint32_t Read(std::uint32_t address, unsigned width) override;
    void Write(std::uint32_t address, std::uint32_t value, unsigned width) override;

    const char* StateText();

  private:
    enum class State { InReset, Halted, Running, LockedUp };
    using Time = std::chrono::steady_clock::time_point;

    std::uint32_t ReadRegister(std::uint32_t address);
    void WriteRegister(std::uint32_t address, std::uint32_t value);
    std::uint32_t HaltingStatus();
    void Control(std::uint32_t value);
    void Transfer(std::uint32_t selection);
    std::uint32_t* CoreRegister(unsigned number);

    void CatchUp();
    void Reset();
    void LeaveReset();
    void Start();
    void FailHard();
    void Halt(std::uint32_t reason);
    bool Debugged() const;
    bool IsCode(std::uint32_t address) const;
    std::uint32_t& Pc();
    std::uint32_t& Status();

    target::ServedSimulation& device_;
    const CoreFaults faults_;
    State state_ = State::InReset;
    Time due_;  ///< the end of the reset, or the crash
    bool crashDue_ = false;
    bool resetSeen_ = true;
    std::uint32_t breakpoints_ = 0;   ///< FP_CTRL
    std::uint32_t control_ = 0;       ///< the low half of DHCSR
    std::uint32_t catches_ = 0;       ///< DEMCR
    std::uint32_t haltReasons_ = 0;   ///< DFSR
    std::uint32_t transferData_ = 0;  ///< DCRDR
    std::uint32_t processStack_ = 0;
    std::uint32_t specials_ = 0;  ///< CONTROL, FAULTMASK, BASEPRI, PRIMASK
};

}  // namespace probe
