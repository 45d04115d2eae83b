// FlashCorvane: one connected microcontroller, and all that can be done to its flash.
//
// The record below is fixed when the object is built, the per-load state excepted. The operations
// are member functions so that each can reach the record; where they live is said above each
// group. What needs nothing but the host is a function of the file that uses it. Operations that
// face the user return true when they are done and false when they have shown a failure. Whatever
// else goes wrong is an exception derived from std::exception.

#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "device/DeviceClass.h"
#include "plugin/HostAccess.h"

enum class RegisterChoice : std::uint8_t;

class FlashCorvane {
  public:
    /// Identifies the device through the host, and halts it. The second and the third text mean
    /// nothing to this family.
    FlashCorvane(std::string variant, const std::string& text2, const std::string& text3,
                 IFlashHost* host);

    // device/Identification.cpp
    bool FlashAvailable() const;
    bool AddressWithinFlash(std::uint32_t address) const;
    bool AddressWithinFlash(std::uint32_t address, std::int32_t size) const;

    // device/DeviceInformation.cpp
    void Initialize();

    // device/SettingsReset.cpp
    void ResetSettings(std::int32_t mode);

    // flash/ProgramLoad.cpp
    bool WriteDataToFlash(const std::uint8_t* data, std::uint32_t address, std::uint32_t length,
                          std::int16_t page);

    // operations/PerformOperation.cpp
    const char* ListSupportedOperations() const;
    bool PerformOperation(const char* operationName);

  private:
    using RangeOperation = bool (FlashCorvane::*)(std::uint32_t start, std::uint32_t end);
    using RegisterValues = std::array<std::uint32_t, 2>;
    using CommitRequests = std::array<bool, 2>;
    struct NamedOperation;
    struct Operations;

    // device/Identification.cpp
    void IdentifyClass(std::uint32_t identification);
    void ReadSizes();

    // device/DeviceInformation.cpp
    std::int32_t VerboseMode() const;

    // flash/InitializeDevice.cpp
    bool InitializeDevice();
    void SetUpClockAndTiming();
    bool SystemResetAndHalt();
    bool ROMAliasClear();

    // flash/WriteKey.cpp
    std::uint32_t KeyedCommand(std::uint32_t command) const;

    // flash/Erase.cpp
    bool Erase();
    bool EraseAsSelected();
    bool MassErase();
    bool PageErase(std::uint32_t start, std::uint32_t end);
    bool EraseSectors(std::uint32_t first, std::uint32_t last, std::uint32_t keyedCommand);
    bool EraseSector(std::uint32_t sector, std::uint32_t keyedCommand);

    // flash/Program.cpp
    bool Program(const std::uint8_t* data, std::uint32_t address, std::uint32_t length,
                 std::int16_t page);

    // flash/ProgramLoad.cpp
    void EraseForSection(std::uint32_t address, std::uint32_t last);

    // verify/Ranges.cpp
    bool RangeWithinFlash(std::uint32_t start, std::uint32_t end) const;
    bool RunOnSelectedRange(const std::string& operationName, const std::string& selectionKey,
                            const std::string& startKey, const std::string& endKey,
                            RangeOperation operation);

    // verify/BlankCheck.cpp
    bool BlankCheck();
    bool BlankCheckByAddress(std::uint32_t start, std::uint32_t end);
    bool ChunkIsBlank(const std::vector<std::uint8_t>& buffer, std::uint32_t count,
                      std::uint32_t address);

    // verify/Checksum.cpp
    bool CalculateChecksum();
    bool CalculateChecksumByAddress(std::uint32_t start, std::uint32_t end);
    void InitCRC32LUT();
    void UpdateCRC32(std::uint32_t& crc, const std::uint8_t* bytes, std::uint32_t count) const;

    // operations/PerformOperation.cpp
    void RunOperation(std::string_view operationName);
    template <typename Step>
    void RunOperationStep(const std::string& statusText, const std::string& errorText, Step step);
    void RunOneStep(const NamedOperation& operation);
    void RunErase(const NamedOperation& operation);
    void RunUserRegisterOperation(const NamedOperation& operation);
    void RunTest(const NamedOperation&);

    // operations/UserRegisters.cpp
    bool UserRegisterOperation(const NamedOperation& operation);
    void ReadUserRegisters(RegisterChoice choice);
    bool ProgramUserRegisters(RegisterChoice choice);
    void CommitUserRegister(std::uint32_t index);

    // operations/MacAddress.cpp
    void ReadMACAddress(const RegisterValues& values);
    bool ProgramMACAddress(CommitRequests& requests);
    bool ParseMACAddressString(const std::string& text, std::uint32_t& register0,
                               std::uint32_t& register1);

    std::uint64_t p_mInstanceId = 0;  ///< goes out with every trace line
    HostAccess p_mHost;               ///< the host is not owned
    std::string p_mVariant;
    std::vector<std::uint32_t> p_mErasedSectors;  ///< in this load; in ascending order
    std::array<std::uint32_t, 256> p_mCRC32LUT{};
    std::uint32_t p_mFlashSize = 0;   ///< bytes; 0 without usable flash
    std::uint32_t p_mRAMSize = 0;     ///< bytes
    std::uint32_t p_mSectorSize = 0;  ///< bytes
    DeviceClass p_mClassRev = DeviceClass::Unknown;
    std::string p_mFamily;
    bool p_mFlashErased = false;  ///< this load's erase is done
    bool p_mUseFlashBuffer = false;
    bool p_mResetPending = true;  ///< this load may still reset the target
};
