// MemoryMap: what lies where in the target's address space, and the rules for reaching it.

#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <span>

#include "target/simulated/FlashArray.h"
#include "target/simulated/FlashController.h"
#include "target/simulated/Loader.h"
#include "target/simulated/Ram.h"
#include "target/simulated/RegisterFile.h"
#include "target/simulated/SystemControl.h"
#include "target/simulated/options/DeviceOptions.h"

namespace target {

// Flash can be reached on either page, everything else on the general one only.
inline constexpr int kFlashPage = 0;
inline constexpr int kGeneralPage = 1;

struct Transfer {
    std::size_t count;
    std::uint32_t address;
    int page;
    std::size_t width;

    /// 0 when the transfer doesn't fit into the address space.
    std::uint64_t SizeBytes() const;
};

class MemoryMap {
  public:
    using Time = std::chrono::nanoseconds;

    MemoryMap(const DeviceOptions& options, FlashArray& flash, Ram& ram, RegisterFile& registers,
              SystemControl& system, FlashController& controller, Loader& loader);

    /// Both throw RuleBroken; of a transfer to several registers, those before the refused one
    /// have been written then.
    void Read(const Transfer& transfer, std::uint8_t* bytes, Time now) const;
    void Write(const Transfer& transfer, const std::uint8_t* bytes, CoreState core, Time now);

    /// What a register reads, without being read.
    std::uint32_t PeekRegister(std::uint32_t address, Time now) const;

  private:
    enum class Region { Flash, Ram, Registers };

    Region CheckedRegion(const Transfer& transfer) const;
    void ReadFlash(std::uint32_t address, std::span<std::uint8_t> bytes, Time now) const;
    std::uint32_t ReadRegister(std::uint32_t address, Time now) const;
    void WriteRegister(std::uint32_t address, std::uint32_t value, CoreState core, Time now);

    const RegisterFault registerFault_;
    FlashArray& flash_;
    Ram& ram_;
    RegisterFile& registers_;
    SystemControl& system_;
    FlashController& controller_;
    Loader& loader_;
};

}  // namespace target
