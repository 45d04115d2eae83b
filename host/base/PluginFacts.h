// What a host knows of this plug-in and its devices beyond the two interface headers: names of
// operations, modes of a settings reset, titles of displays, pages, and the memory that programming
// and erasing go through. It is told once, here; docs/host-guide.md explains it.

#pragma once

#include <algorithm>
#include <array>
#include <chrono>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace host::plugin {

// The operations, by the names that Initialize lists.
inline constexpr char kErase[] = "Erase";
inline constexpr char kBlankCheck[] = "BlankCheck";
inline constexpr char kCalculateChecksum[] = "CalculateChecksum";
inline constexpr char kReadMac[] = "ReadMACAddress";
inline constexpr char kProgramMac[] = "ProgramMACAddress";

inline std::string ReadRegisterOperation(unsigned index) {
    return "ReadUserRegister" + std::to_string(index);
}

inline std::string ProgramRegisterOperation(unsigned index) {
    return "ProgramUserRegister" + std::to_string(index);
}

/// All of them, in the plug-in's order.
inline constexpr const char* kOperations[] = {
    kErase,
    kBlankCheck,
    kCalculateChecksum,
    "ProgramUserRegister0",
    "ReadUserRegister0",
    "ProgramUserRegister1",
    "ReadUserRegister1",
    kProgramMac,
    kReadMac,
};

/// What stands between the names in the list of operations.
inline constexpr std::string_view kOperationSeparator = " | ";

inline std::vector<std::string> OperationNames(const std::string& joined) {
    std::vector<std::string> names;
    for (std::size_t start = 0; start <= joined.size();) {
        const std::size_t end = std::min(joined.find(kOperationSeparator, start), joined.size());
        names.push_back(joined.substr(start, end - start));
        start = end + kOperationSeparator.size();
    }
    return names;
}

/// What ends a step of an operation: the whole text, and the end of the other one.
inline constexpr char kStepDone[] = "Operation completed successfully.";
inline constexpr char kStepFailed[] = "..";

/// The events at which a host resets the settings.
enum class ResetMode : int { LoadBegins = 0, TargetWillRun = 1, LoadComplete = 2 };

// The titles of the progress displays.
inline constexpr char kEraseTitle[] = "Erasing Flash.";
inline constexpr char kBlankCheckTitle[] = "Performing Blank Check";
inline constexpr char kChecksumTitle[] = "CRC Calculation";

/// The page of the target's memory that holds flash contents, and the one for everything else.
/// A section is written with the latter, because what the plug-in writes with it goes to RAM.
inline constexpr std::int16_t kFlashPage = 0;
inline constexpr std::int16_t kRamPage = 1;

inline constexpr std::uint32_t kIdentificationRegister = 0x400FE000;
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
