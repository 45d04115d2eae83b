// The register table of the family and the rules of plain register access.

#include "target/simulated/RegisterFile.h"

#include <fmt/format.h>

#include <bit>

#include "target/simulated/Rules.h"
#include "target/simulated/options/DeviceClass.h"

namespace target {

namespace {

// Presence is decided once, when the device is made: `registers_` holds the registers of this
// device and no others, so that all later questions are a look-up. A write changes `value` alone;
// what comes back at a reset is `resetValue`, which only options and commits change.

// What a register's presence can depend on; a device has a register when they share a trait.
using Traits = std::uint32_t;
constexpr Traits Of(DeviceKind kind) {
    return 1U << static_cast<unsigned>(kind);
}
constexpr Traits kRavik = Of(DeviceKind::Ravik);
constexpr Traits kMesk = Of(DeviceKind::Mesk);
constexpr Traits kOrrin = Of(DeviceKind::Orrin);
constexpr Traits kQuen = Of(DeviceKind::Quen);
constexpr Traits kOldest = kRavik | Of(DeviceKind::Tolva) | kMesk;
constexpr Traits kNewest = Of(DeviceKind::Velk) | Of(DeviceKind::Dorna);
constexpr Traits kAll = 0xFF;
constexpr Traits kRom = 0x100;
constexpr Traits kOneSizeRegister = 0x200;
constexpr Traits kTwoSizeRegisters = 0x400;

Traits TraitsOf(const DeviceOptions& options) {
    return Of(KindOf(options)) | (HasRom(options) ? kRom : 0) |
           (HasSizeRegisters(options) ? kTwoSizeRegisters : kOneSizeRegister);
}

}  // namespace

struct RegisterFile::Row {
    std::uint32_t address;
    Kind kind;
    const char* name;
    Traits devices;
    std::uint32_t resetValue;
    bool staysAtReset = false;  ///< only power-up brings it back
};

// Reset values of 0 in read-only rows and in the key configuration come from the options. The
// clock registers wake up with the bits set that a driver has to clear. Clock, flash timing and the
// test registers belong to the part of the device that a reset by the debug port doesn't reach.
const RegisterFile::Row RegisterFile::kRows[] = {
    {reg::kTestControl, Kind::ReadWrite, "system control 0x400AE2C0", kQuen, 0x00000001, true},
    {reg::kFlashAddress, Kind::ReadWrite, "flash address", kAll, 0},
    {reg::kTestLock, Kind::ReadWrite, "flash control 0x400FD0FC", kQuen, 0, true},
    {reg::kFlashSize, Kind::ReadOnly, "flash size", kTwoSizeRegisters, 0},
    {reg::kRamSize, Kind::ReadOnly, "SRAM size", kTwoSizeRegisters, 0},
    {reg::kIdentification, Kind::ReadOnly, "device identification 0", kAll, 0},
    {reg::kCapabilities, Kind::ReadOnly, "device capabilities 0", kOneSizeRegister, 0},
    {reg::kSoftwareReset0, Kind::ReadWrite, "software reset control 0", kAll, 0},
    {reg::kSoftwareReset0 + 4, Kind::ReadWrite, "software reset control 1", kAll, 0},
    {reg::kSoftwareReset0 + 8, Kind::ReadWrite, "software reset control 2", kAll, 0},
    {reg::kClockStatus, Kind::ReadWrite, "system control 0x400FE058", kOldest, 0, true},
    {reg::kClock, Kind::ReadWrite, "clock configuration", kAll, 0x01C03FF3, true},
    {reg::kClock2, Kind::ReadWrite, "clock configuration 2", kOrrin, 0x80007810, true},
    {reg::kRomControl, Kind::WriteOneToClear, "ROM control", kRom, 0x00000001},
    {reg::kFlashTiming, Kind::ReadWrite, "flash timing", kOldest, 0x00000031, true},
    {0x400FE1A0, Kind::ReadOnly, "flash-buffer capability", kAll & ~kOldest, 0x00000001},
    {0x400FE1A0, Kind::ReadOnly, "flash-buffer capability", kOldest, 0},
    {reg::kKeyConfiguration, Kind::ReadOnly, "key configuration", kAll, 0},
    {reg::kUserRegister0, Kind::ReadWrite, "user register 0", kAll & ~kRavik, 0xFFFFFFFF},
    {reg::kUserRegister1, Kind::ReadWrite, "user register 1", kAll & ~kRavik, 0xFFFFFFFF},
    {reg::kFlashBlocks0, Kind::ReadWrite, "flash block 0", kMesk, 0xFFFFFFFF},
    {reg::kFlashBlocks0 + 4, Kind::ReadWrite, "flash block 1", kMesk, 0xFFFFFFFF},
    {reg::kFlashBlocks0 + 8, Kind::ReadWrite, "flash block 2", kMesk, 0xFFFFFFFF},
    {reg::kFlashBlocks0 + 12, Kind::ReadWrite, "flash block 3", kMesk, 0xFFFFFFFF},
    {0x400FE500, Kind::ReadWrite, "watchdog software reset", kNewest, 0},
};

RegisterFile::RegisterFile(const DeviceOptions& options) : className_(options.className) {
    const Traits traits = TraitsOf(options);
    for (const Row& row : kRows) {
        if ((row.devices & traits) == 0) continue;
        registers_[row.address] = {row.name, row.kind, row.resetValue, row.resetValue,
                                   row.staysAtReset};
    }
    SetOptionValues(options);
    PowerUp();
}

// The size registers hold one less than the number of units, so that the largest size fits.
void RegisterFile::SetOptionValues(const DeviceOptions& options) {
    const std::uint32_t flashField = options.flashSizeBytes / 2048 - 1;
    const std::uint32_t ramField = options.ramSizeBytes / 256 - 1;
    SetResetValue(reg::kIdentification, options.identification);
    SetResetValue(reg::kKeyConfiguration, options.keyConfiguration);
    if (!HasSizeRegisters(options)) {
        SetResetValue(reg::kCapabilities, ramField << 16 | flashField);
        return;
    }
    const auto sectorExponent =
        static_cast<std::uint32_t>(std::countr_zero(options.sectorSizeBytes / 1024));
    SetResetValue(reg::kFlashSize, sectorExponent << 16 | flashField);
    SetResetValue(reg::kRamSize, ramField);
}

// The one place where an address without a register is noticed.
const RegisterFile::Register& RegisterFile::Find(std::uint32_t address) const {
    const auto found = registers_.find(address);
    if (found == registers_.end()) {
        Refuse(rule::kMappedAddress,
               fmt::format("a device of class {} has no memory and no register at {:#x}",
                           className_, address));
    }
    return found->second;
}

std::uint32_t RegisterFile::Read(std::uint32_t address) const {
    return Find(address).value;
}

// Effects beyond the value are for system control and the flash controller, which call this.
void RegisterFile::Write(std::uint32_t address, std::uint32_t value) {
    const Register& found = Find(address);
    if (found.kind == Kind::ReadOnly) {
        Refuse(rule::kReadOnlyRegister, fmt::format("the {} register is read-only", found.name));
    }
    Register& written = registers_.at(address);
    written.value = found.kind == Kind::WriteOneToClear ? written.value & ~value : value;
}

void RegisterFile::PowerUp() {
    for (auto& [address, entry] : registers_)
        entry.value = entry.resetValue;
}

void RegisterFile::Reset() {
    for (auto& [address, entry] : registers_)
        if (!entry.staysAtReset) entry.value = entry.resetValue;
}

std::uint32_t RegisterFile::ResetValue(std::uint32_t address) const {
    return Find(address).resetValue;
}

// What the register reads now stays until the next reset.
void RegisterFile::SetResetValue(std::uint32_t address, std::uint32_t value) {
    Find(address);
    registers_.at(address).resetValue = value;
}

}  // namespace target
