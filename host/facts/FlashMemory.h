// What a host knows of the devices' memory: its pages, the registers that tell what a device is,
// and those through which flash is erased and user registers are committed.

#pragma once

#include <array>
#include <cstdint>
#include <string_view>

namespace host::plugin {

/// The page of the target's memory that holds flash contents, and the one for everything else.
/// A section is written with the latter, because what the plug-in writes with it goes to RAM.
inline constexpr std::int16_t kFlashPage = 0;
inline constexpr std::int16_t kRamPage = 1;

inline constexpr std::uint32_t kIdentificationRegister = 0x400FE000;

/// No device of the family has anything on its bus here.
inline constexpr std::uint32_t kNothingAt = 0x10000000;

/// The core's debug control and status register: that a debugger is at work, and has halted it.
inline constexpr std::uint32_t kDebugStatusRegister = 0xE000EDF0;
inline constexpr std::uint32_t kDebuggedBit = 0x1;
inline constexpr std::uint32_t kHaltedBit = 0x20000;
inline constexpr std::array<std::uint32_t, 2> kUserRegisters{0x400FE1E0, 0x400FE1E4};

// The flash command register takes an erase command in its low bits, under a key in the high half,
// and shows the same bit until the erase is done. A sector is named by the flash address register.
inline constexpr std::uint32_t kFlashAddressRegister = 0x400FD000;
inline constexpr std::uint32_t kFlashCommandRegister = 0x400FD008;
inline constexpr std::uint32_t kEraseSectorBit = 0x2;
inline constexpr std::uint32_t kEraseAllBit = 0x4;

/// Whether the plug-in can erase all of a device's flash with one command. Of the Mesk class it
/// knows the flash block registers for these sizes only.
inline bool ErasesWhole(std::string_view family, std::uint64_t flashBytes) {
    return !family.starts_with("Mesk") ||
           (flashBytes % 0x8000 == 0 && flashBytes != 0 && flashBytes <= 0x20000);
}

// It commits the user register that the flash address register names in the same way.
inline constexpr std::uint32_t kCommitBit = 0x8;
inline constexpr std::uint32_t kCommitOperand = 0x80000000;  ///< and the register's index

}  // namespace host::plugin
