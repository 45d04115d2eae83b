// What a host knows of the flash loader: its file, and the memory of the target through which the
// plug-in hands it chunks.

#pragma once

#include <array>
#include <chrono>
#include <cstdint>

namespace host::plugin {

// What the plug-in has the host load: a file in a directory below the host's.
inline constexpr char kLoaderFile[] = "FlashLoaderMerrow.out";
inline constexpr char kLoaderSubdirectory[] = R"(..\..\merrow\)";

// The loader's two chunk buffers lie one behind the other, then its two parameter blocks. It
// programs blocks of 128 bytes; the plug-in widens each section to whole ones.
inline constexpr std::uint32_t kBlockBytes = 128;
inline constexpr std::uint32_t kChunkBytes = 2048;
inline constexpr std::uint32_t kLoaderBuffers = 0x20000000;
inline constexpr std::array<std::uint32_t, 2> kParameterBlocks{0x20001000, 0x20001010};

// The words of a parameter block, by their offset.
inline constexpr std::uint32_t kChunkAddressOffset = 4;
inline constexpr std::uint32_t kChunkSizeOffset = 8;
inline constexpr std::uint32_t kStatusOffset = 12;
inline constexpr std::uint32_t kStatusPending = 0xFFFFFFFF;

/// How long the plug-in sleeps after it has found a chunk pending, before it looks again.
inline constexpr std::chrono::milliseconds kPollInterval{100};

}  // namespace host::plugin
