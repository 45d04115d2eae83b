// Asking the device for what the plan has to know.

#include "host/flashing/DevicePlan.h"

#include "host/base/PluginFacts.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/Unchanged.h"

namespace host {

FlashGeometry GeometryOf(const FlashDevice& device) {
    const DeviceInfo& info = device.Info();
    return {info.flashBytes, info.sectorBytes, plugin::ErasesWhole(info.family, info.flashBytes)};
}

ProgramPlan PlanOnDevice(FlashDevice& device, const image::Image& image, const EraseChoice& erase,
                         bool rewrite) {
    const bool look = erase.kind == EraseChoice::Kind::Necessary && !rewrite;
    return PlanProgram(image, look ? FindUnchanged(device, image) : AddressSet{},
                       GeometryOf(device), erase);
}

}  // namespace host
