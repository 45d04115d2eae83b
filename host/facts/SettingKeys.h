// The keys and choice labels that the plug-in and its host agree on, each spelled once on the
// host's side.

#pragma once

namespace host::keys {

inline constexpr char kProgramOption[] = "FlashProgramOption";
inline constexpr char kProgramBlankCheck[] = "FlashProgramBlankCheckOption";
inline constexpr char kProgramCrc[] = "FlashProgramCRCOption";
inline constexpr char kEraseType[] = "FlashEraseType";
inline constexpr char kEraseStart[] = "FlashEraseStartAddr";
inline constexpr char kEraseEnd[] = "FlashEraseEndAddr";
inline constexpr char kBlankCheckSelection[] = "FlashBlankCheckSelection";
inline constexpr char kBlankCheckStart[] = "FlashBlankCheckStartAddr";
inline constexpr char kBlankCheckEnd[] = "FlashBlankCheckEndAddr";
inline constexpr char kChecksumSelection[] = "FlashChecksumSelection";
inline constexpr char kChecksumStart[] = "FlashChecksumStartAddr";
inline constexpr char kChecksumEnd[] = "FlashChecksumEndAddr";
inline constexpr char kChecksumValue[] = "FlashChecksumValue";
inline constexpr char kMacInput[] = "FlashMACAddrInput";
inline constexpr char kMacCommit[] = "FlashMACAddrCommit";
inline constexpr const char* kRegisterInputs[] = {"FlashUserRegister0Input",
                                                  "FlashUserRegister1Input"};
inline constexpr const char* kRegisterCommits[] = {"FlashUserRegister0Commit",
                                                   "FlashUserRegister1Commit"};
inline constexpr char kCrystalFreq[] = "FlashCrystalFreq";
inline constexpr char kTimeout[] = "FlashTimeoutValue";
inline constexpr char kReset[] = "FlashResetSetting";
inline constexpr char kVerbose[] = "FlashVerboseMode";
inline constexpr char kFlashSize[] = "DeviceInfoFlashSize";
inline constexpr char kRamSize[] = "DeviceInfoRAMSize";
inline constexpr char kSectorSize[] = "DeviceInfoSectorSize";
inline constexpr char kFamily[] = "DeviceInfoFamily";

/// Asked for by the host check alone.
inline constexpr char kSimulatesTime[] = "HostSimulatesTime";

inline constexpr char kEntireFlash[] = "Entire Flash";
inline constexpr char kByAddressRange[] = "By Address Range";
inline constexpr char kNecessaryPages[] = "Necessary Pages Only";
inline constexpr char kNoErase[] = "Do Not Erase Flash Memory";
inline constexpr char kEraseOptions[] = "Use the Erase Options Specified Below";

}  // namespace host::keys
