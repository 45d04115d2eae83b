// AccessPort: a memory access port (MEM-AP), which turns accesses to its few registers into
// accesses to a bus.

#pragma once

#include <cstdint>

namespace probe {

/// Values stand in the low bits; addresses are multiples of the width, which is 1, 2 or 4. Both
/// throw target::TargetError where the bus reports an error.
class Bus {
  public:
    virtual ~Bus() = default;
    virtual std::uint32_t Read(std::uint32_t address, unsigned width) = 0;
    virtual void Write(std::uint32_t address, std::uint32_t value, unsigned width) = 0;
};

class AccessPort {
  public:
    explicit AccessPort(Bus& bus) : bus_(bus) {}

    /// At the register's offset among the port's own.
    std::uint32_t Read(unsigned reg);
    void Write(unsigned reg, std::uint32_t value);

  private:
    unsigned Width() const;
    unsigned Lane() const { return 8 * (address_ & 3); }
    void Step();

    Bus& bus_;
    std::uint32_t control_ = 2;
    std::uint32_t address_ = 0;
};

}  // namespace probe
