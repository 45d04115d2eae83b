// The plan of a load as a device's flash is now.

#pragma once

#include "host/flashing/ProgramPlan.h"
#include "host/image/Image.h"

namespace host {

class FlashDevice;

FlashGeometry GeometryOf(const FlashDevice& device);

/// Looks for sectors that can be left alone, unless `rewrite` says that none is to be.
ProgramPlan PlanOnDevice(FlashDevice& device, const image::Image& image, const EraseChoice& erase,
                         bool rewrite);

}  // namespace host
