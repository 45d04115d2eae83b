// What the plug-in has found out about the device.

#pragma once

#include <cstdint>
#include <string>

#include "base/AddressRange.h"

namespace host {

struct DeviceInfo {
    std::string family;
    std::uint64_t flashBytes = 0;
    std::uint64_t ramBytes = 0;
    std::uint32_t sectorBytes = 0;
    std::uint32_t identification = 0;
    bool hasFlash = false;
    std::string operations = {};  ///< joined by " | "

    base::AddressRange Flash() const { return {0, static_cast<std::uint32_t>(flashBytes - 1)}; }
};

}  // namespace host
