// Asking the device for what the plan has to know.

#include "host/flashing/DevicePlan.h"

#include <fmt/format.h>

#include <algorithm>

#include "host/driver/FlashDevice.h"
#include "host/facts/FlashMemory.h"
#include "host/facts/SettingKeys.h"
#include "host/flashing/Unchanged.h"

namespace host {

FlashGeometry GeometryOf(const FlashDevice& device) {
    const DeviceInfo& info = device.Info();
    return {info.flashBytes, info.sectorBytes, plugin::ErasesWhole(info.family, info.flashBytes)};
}

void RequireWholeErase(const FlashDevice& device, const std::string& option) {
    const DeviceInfo& info = device.Info();
    if (GeometryOf(device).erasesWhole) return;
    throw Failure(
        ExitStatus::DeviceFailed,
        fmt::format("the plug-in can't erase a flash of {} ({}) all at once; nothing was "
                    "touched; name its sectors with {} {}",
                    SizeText(info.flashBytes), info.family, option, RangeText(info.Flash())));
}

namespace {

void RequireErasable(const FlashDevice& device, const EraseChoice& erase) {
    const base::AddressRange flash = device.Info().Flash();
    if (erase.kind == EraseChoice::Kind::Everything)
        return RequireWholeErase(device, "program --erase");
    if (erase.kind == EraseChoice::Kind::Range &&
        std::max(erase.range.first, erase.range.last) > flash.last)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("the settings {} and {}, {:#x} and {:#x}, don't lie in the "
                                  "device's flash, {}",
                                  keys::kEraseStart, keys::kEraseEnd, erase.range.first,
                                  erase.range.last, RangeText(flash)));
}

}  // namespace

ProgramPlan PlanOnDevice(FlashDevice& device, const image::Image& image, const EraseChoice& erase,
                         bool rewrite) {
    RequireErasable(device, erase);
    const bool look = erase.kind == EraseChoice::Kind::Necessary && !rewrite;
    return PlanProgram(image, look ? FindUnchanged(device, image) : base::AddressSet{},
                       GeometryOf(device), erase);
}

}  // namespace host
