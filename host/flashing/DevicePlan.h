// The plan of a load as a device's flash is now.

#pragma once

#include <string>

#include "host/flashing/ProgramPlan.h"
#include "host/image/Image.h"

namespace host {

class FlashDevice;

FlashGeometry GeometryOf(const FlashDevice& device);

/// Failure (DeviceFailed) when no command of the plug-in erases all of this flash; `option` takes a
/// range in place of it.
void RequireWholeErase(const FlashDevice& device, const std::string& option);

/// Looks for sectors that can be left alone, unless `rewrite` says that none is to be. Failure for
/// an erase that the plug-in can't carry out: it would program over what is there.
ProgramPlan PlanOnDevice(FlashDevice& device, const image::Image& image, const EraseChoice& erase,
                         bool rewrite);

}  // namespace host
