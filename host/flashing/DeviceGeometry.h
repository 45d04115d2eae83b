// What of a device can be erased at once, and what can't.

#pragma once

#include <string>

#include "host/driver/DeviceInfo.h"
#include "host/flashing/LoadRequest.h"
#include "host/flashing/Sectors.h"

namespace host {

FlashGeometry GeometryOf(const DeviceInfo& info);

/// Failure (DeviceFailed) when no command of the plug-in erases all of this flash; `option` takes a
/// range in place of it.
void RequireWholeErase(const DeviceInfo& info, const std::string& option);

/// The same for what a load is to erase. Failure (WrongUsage) for a range beyond the flash.
void RequireErasable(const DeviceInfo& info, const EraseChoice& erase);

}  // namespace host
