// Where the target keeps what this library reads and writes. All registers are 32 bits wide.

#pragma once

#include <cstdint>

namespace Register {

// Identification and capabilities.
inline constexpr std::uint32_t DeviceIdentification0 = 0x400FE000;
inline constexpr std::uint32_t DeviceCapabilities0 = 0x400FE008;
inline constexpr std::uint32_t FlashSize = 0x400FDFC0;
inline constexpr std::uint32_t SramSize = 0x400FDFC4;
inline constexpr std::uint32_t FlashBufferCapability = 0x400FE1A0;

// System control and clock.
inline constexpr std::uint32_t SoftwareReset0 = 0x400FE040;
inline constexpr std::uint32_t SoftwareReset1 = 0x400FE044;
inline constexpr std::uint32_t SoftwareReset2 = 0x400FE048;
inline constexpr std::uint32_t ClockSetup = 0x400FE058;
inline constexpr std::uint32_t ClockConfiguration = 0x400FE060;
inline constexpr std::uint32_t ClockConfiguration2 = 0x400FE070;
inline constexpr std::uint32_t RomControl = 0x400FE0F0;
inline constexpr std::uint32_t FlashTiming = 0x400FE140;
inline constexpr std::uint32_t WatchdogReset = 0x400FE500;

// The fix-up of the Quen class.
inline constexpr std::uint32_t QuenUnlock = 0x400FD0FC;
inline constexpr std::uint32_t QuenFixUp = 0x400AE2C0;

// Flash controller.
inline constexpr std::uint32_t FlashAddress = 0x400FD000;
inline constexpr std::uint32_t FlashCommand = 0x400FD008;
inline constexpr std::uint32_t KeyConfiguration = 0x400FE1D0;
inline constexpr std::uint32_t FlashBlock0 = 0x400FE400;
inline constexpr std::uint32_t FlashBlock1 = 0x400FE404;
inline constexpr std::uint32_t FlashBlock2 = 0x400FE408;
inline constexpr std::uint32_t FlashBlock3 = 0x400FE40C;

// User registers.
inline constexpr std::uint32_t UserRegister0 = 0x400FE1E0;
inline constexpr std::uint32_t UserRegister1 = 0x400FE1E4;

}  // namespace Register

/// The command bits of the flash command register. The controller clears a bit when it is done.
namespace FlashCommandBit {

inline constexpr std::uint32_t EraseSector = 0x2;
inline constexpr std::uint32_t EraseAll = 0x4;
inline constexpr std::uint32_t CommitUserRegister = 0x8;

}  // namespace FlashCommandBit

/// Target RAM that the host shares with the flash loader: two buffers, each with its parameter
/// block. A block's words are: reserved, flash address, byte count, status.
namespace LoaderMemory {

inline constexpr std::uint32_t Buffers = 0x20000000;
inline constexpr std::uint32_t BufferSize = 2048;
inline constexpr std::uint32_t ParameterBlocks = 0x20001000;
inline constexpr std::uint32_t ParameterBlockSize = 16;
inline constexpr std::uint32_t ChunkOffset = 4;
inline constexpr std::uint32_t StatusOffset = 12;

/// The host sets this status with each chunk; the loader replaces it when the chunk is done.
inline constexpr std::uint32_t ChunkPending = 0xFFFFFFFF;

}  // namespace LoaderMemory
