// The simulated devices are the classes.

#include "host/targets/KnownDevices.h"

#include "target/simulated/options/DeviceClass.h"

namespace host {

std::vector<KnownDevice> KnownDevices() {
    std::vector<KnownDevice> devices;
    for (const target::DeviceClass& one : target::DeviceClasses())
        devices.push_back({one.name, one.flashSizeBytes});
    return devices;
}

}  // namespace host
