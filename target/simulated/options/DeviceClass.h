// DeviceClass: the family's classes in one table, and the traits in which their silicon differs.

#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "target/simulated/options/DeviceOptions.h"

namespace target {

/// In the order of age. From Quen on there are two write keys.
enum class DeviceKind { Ravik, Tolva, Mesk, Orrin, Pell, Quen, Velk, Dorna };

struct DeviceClass {
    DeviceKind kind;
    const char* name;
    std::uint32_t identification;
    std::uint32_t flashSizeBytes;
    std::uint32_t ramSizeBytes;
    std::uint32_t sectorSizeBytes;
    std::uint32_t keyConfiguration;
};

const std::vector<DeviceClass>& DeviceClasses();

/// Null when there is no class of that name.
const DeviceClass* FindDeviceClass(std::string_view name);

/// The kind of valid options.
DeviceKind KindOf(const DeviceOptions& options);

/// Devices whose identification carries a class field of 8 or more report their sizes, the
/// sector size among them, in two registers of their own.
bool HasSizeRegisters(const DeviceOptions& options);

/// Ravik and the first Tolva have no ROM, and so nothing that could lie over the flash.
bool HasRom(const DeviceOptions& options);

/// The three oldest classes don't know how to time their flash until somebody sets their clock up
/// and tells them. From the third revision on they do.
bool NeedsFlashSetUp(const DeviceOptions& options);

/// The first silicon of Orrin wakes up with a clock that is too fast for its flash.
bool NeedsClockFixUp(const DeviceOptions& options);

}  // namespace target
