// Wire: the characters by which a debugger moves the pins of a distant debug port (OpenOCD's
// "remote_bitbang"), and a cable that may come off.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "tests/probe/AccessPort.h"
#include "tests/probe/DebugPort.h"

namespace probe {

/// Comes off in the middle of the work: in place of the given access to that word.
class Cable final : public Bus {
  public:
    struct Fault {
        std::uint32_t address = 0;
        unsigned accesses = 0;  ///< 0: never
    };

    Cable(Bus& bus, const Fault& fault) : bus_(bus), fault_(fault) {}

    std::uint32_t Read(std::uint32_t address, unsigned width) override;
    void Write(std::uint32_t address, std::uint32_t value, unsigned width) override;
    bool IsOff() const { return off_; }

  private:
    void Pass(std::uint32_t address);

    Bus& bus_;
    Fault fault_;
    bool off_ = false;
};

class Wire {
  public:
    Wire(DebugPort& port, const Cable& cable) : port_(port), cable_(cable) {}

    /// Returns what is to be sent back; nothing when the debugger has left.
    std::optional<std::string> Take(std::string_view characters);

  private:
    void SetPins(unsigned pins);

    DebugPort& port_;
    const Cable& cable_;
    bool clock_ = false;
};

}  // namespace probe
