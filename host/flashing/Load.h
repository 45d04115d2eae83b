// Running the plan of a load on a device.

#pragma once

#include <optional>
#include <string>

#include "host/flashing/Comparison.h"
#include "host/flashing/LoadPlan.h"
#include "host/image/Image.h"

namespace host {

class FlashDevice;

/// Refuses an erase that the plug-in can't carry out (it would program over what is there), and
/// reads what a plan has to know: see ReadForPlan. Nothing of the device is changed.
LoadPlan PlanOnDevice(FlashDevice& device, const LoadRequest& request, const image::Image& image);

/// What a load came to that ended without a failure.
struct LoadResult {
    std::optional<std::string> checksum = {};  ///< "0x" and hexadecimal digits, when asked for
    Differences differences = {};              ///< none, too, when nothing was to be compared
};

/// Writes the plug-in's settings, erases, programs, and then reads back what the plan asks for.
/// `image` is what the plan was made for. DeviceFailure; Failure (DeviceFailed) when the plug-in
/// claims success, but has erased less than planned.
LoadResult RunLoad(FlashDevice& device, const LoadPlan& plan, const image::Image& image);

/// What can still be tried when the flash differs after a load.
std::string AdviceAfter(const LoadPlan& plan, const Differences& differences);

}  // namespace host
