// The device classes that this tool knows of, with the flash that they usually have.

#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace host {

struct KnownDevice {
    std::string name;  ///< "quen"
    std::uint64_t flashBytes;
};

std::vector<KnownDevice> KnownDevices();

}  // namespace host
