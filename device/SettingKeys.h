// The names of the host's settings and the labels that choice settings take.

#pragma once

namespace Setting {

// Published by the plug-in.
inline constexpr auto DeviceInfoFlashSize = "DeviceInfoFlashSize";
inline constexpr auto DeviceInfoRAMSize = "DeviceInfoRAMSize";
inline constexpr auto DeviceInfoSectorSize = "DeviceInfoSectorSize";
inline constexpr auto DeviceInfoFamily = "DeviceInfoFamily";
inline constexpr auto FlashChecksumValue = "FlashChecksumValue";

// Device initialisation and settings reset.
inline constexpr auto FlashVerboseMode = "FlashVerboseMode";
inline constexpr auto FlashResetSetting = "FlashResetSetting";
inline constexpr auto FlashCrystalFreq = "FlashCrystalFreq";

// Erase.
inline constexpr auto FlashEraseType = "FlashEraseType";
inline constexpr auto FlashEraseStartAddr = "FlashEraseStartAddr";
inline constexpr auto FlashEraseEndAddr = "FlashEraseEndAddr";

// Program load.
inline constexpr auto FlashProgramOption = "FlashProgramOption";
inline constexpr auto FlashProgramBlankCheckOption = "FlashProgramBlankCheckOption";
inline constexpr auto FlashProgramCRCOption = "FlashProgramCRCOption";
inline constexpr auto FlashTimeoutValue = "FlashTimeoutValue";

// Blank check and checksum.
inline constexpr auto FlashBlankCheckSelection = "FlashBlankCheckSelection";
inline constexpr auto FlashBlankCheckStartAddr = "FlashBlankCheckStartAddr";
inline constexpr auto FlashBlankCheckEndAddr = "FlashBlankCheckEndAddr";
inline constexpr auto FlashChecksumSelection = "FlashChecksumSelection";
inline constexpr auto FlashChecksumStartAddr = "FlashChecksumStartAddr";
inline constexpr auto FlashChecksumEndAddr = "FlashChecksumEndAddr";

// User registers, by their index.
inline constexpr const char* FlashUserRegisterInput[] = {"FlashUserRegister0Input",
                                                         "FlashUserRegister1Input"};
inline constexpr const char* FlashUserRegisterCommit[] = {"FlashUserRegister0Commit",
                                                          "FlashUserRegister1Commit"};
inline constexpr auto FlashMACAddrInput = "FlashMACAddrInput";
inline constexpr auto FlashMACAddrCommit = "FlashMACAddrCommit";

}  // namespace Setting

/// Compared whole and case-sensitively.
namespace Choice {

inline constexpr auto EntireFlash = "Entire Flash";
inline constexpr auto ByAddressRange = "By Address Range";

inline constexpr auto NecessaryPagesOnly = "Necessary Pages Only";
inline constexpr auto DoNotErase = "Do Not Erase Flash Memory";
inline constexpr auto UseEraseOptions = "Use the Erase Options Specified Below";

}  // namespace Choice
