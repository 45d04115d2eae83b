// Refusing erases that the plug-in can't carry out.

#include "host/flashing/DeviceGeometry.h"

#include <fmt/format.h>

#include <algorithm>

#include "host/base/Errors.h"
#include "host/base/Text.h"
#include "host/facts/FlashMemory.h"
#include "host/facts/SettingKeys.h"

namespace host {

FlashGeometry GeometryOf(const DeviceInfo& info) {
    return {info.flashBytes, info.sectorBytes, plugin::ErasesWhole(info.family, info.flashBytes)};
}

void RequireWholeErase(const DeviceInfo& info, const std::string& option) {
    if (GeometryOf(info).erasesWhole) return;
    throw Failure(
        ExitStatus::DeviceFailed,
        fmt::format("the plug-in can't erase a flash of {} ({}) all at once; nothing was "
                    "touched; name its sectors with {} {}",
                    SizeText(info.flashBytes), info.family, option, RangeText(info.Flash())));
}

void RequireErasable(const DeviceInfo& info, const EraseChoice& erase) {
    if (erase.kind == EraseChoice::Kind::Everything)
        return RequireWholeErase(info, "program --erase");
    const base::AddressRange flash = info.Flash();
    if (erase.kind == EraseChoice::Kind::Range &&
        std::max(erase.range.first, erase.range.last) > flash.last)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("the settings {} and {}, {:#x} and {:#x}, don't lie in the "
                                  "device's flash, {}",
                                  keys::kEraseStart, keys::kEraseEnd, erase.range.first,
                                  erase.range.last, RangeText(flash)));
}

}  // namespace host
