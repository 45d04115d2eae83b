// RegisterFile: the device's registers: which of them a class has, what they read after a reset
// and what a write does to them. The flash command register is not plain storage; the flash
// controller answers for it.

#pragma once

#include <cstdint>
#include <string>
#include <unordered_map>

#include "target/simulated/options/DeviceOptions.h"

namespace target {

namespace reg {

inline constexpr std::uint32_t kFlashAddress = 0x400FD000;
inline constexpr std::uint32_t kTestControl = 0x400AE2C0;
inline constexpr std::uint32_t kFlashCommand = 0x400FD008;
inline constexpr std::uint32_t kTestLock = 0x400FD0FC;
inline constexpr std::uint32_t kIdentification = 0x400FE000;
inline constexpr std::uint32_t kCapabilities = 0x400FE008;
inline constexpr std::uint32_t kFlashSize = 0x400FDFC0;
inline constexpr std::uint32_t kRamSize = 0x400FDFC4;
inline constexpr std::uint32_t kSoftwareReset0 = 0x400FE040;  ///< and two more behind it
inline constexpr std::uint32_t kClockStatus = 0x400FE058;
inline constexpr std::uint32_t kClock = 0x400FE060;
inline constexpr std::uint32_t kClock2 = 0x400FE070;
inline constexpr std::uint32_t kRomControl = 0x400FE0F0;
inline constexpr std::uint32_t kFlashTiming = 0x400FE140;
inline constexpr std::uint32_t kKeyConfiguration = 0x400FE1D0;
inline constexpr std::uint32_t kUserRegister0 = 0x400FE1E0;
inline constexpr std::uint32_t kUserRegister1 = 0x400FE1E4;
inline constexpr std::uint32_t kFlashBlocks0 = 0x400FE400;  ///< and three more behind it

}  // namespace reg

class RegisterFile {
  public:
    explicit RegisterFile(const DeviceOptions& options);

    /// Throw RuleBroken where the class has no register.
    std::uint32_t Read(std::uint32_t address) const;
    void Write(std::uint32_t address, std::uint32_t value);

    bool Has(std::uint32_t address) const { return registers_.contains(address); }

    /// Power comes on: every register takes its reset value.
    void PowerUp();

    /// A reset by the debug port: the same, but for the registers that keep their values through
    /// it.
    void Reset();

    /// The value that the register takes at a reset.
    std::uint32_t ResetValue(std::uint32_t address) const;
    void SetResetValue(std::uint32_t address, std::uint32_t value);

  private:
    enum class Kind { ReadOnly, ReadWrite, WriteOneToClear };
    struct Register {
        const char* name;
        Kind kind;
        std::uint32_t resetValue;
        std::uint32_t value;
        bool staysAtReset;
    };
    struct Row;
    static const Row kRows[];

    const Register& Find(std::uint32_t address) const;
    void SetOptionValues(const DeviceOptions& options);

    const std::string className_;
    std::unordered_map<std::uint32_t, Register> registers_;
};

}  // namespace target
