// What else the sectors of an image hold, so that it can be programmed back with the image.

#pragma once

#include "host/driver/FlashReader.h"
#include "host/flashing/Sectors.h"
#include "host/image/Image.h"
#include "host/output/WorkMeter.h"

namespace host {

/// Of the contents of the image's sectors, the bytes that the image says nothing about, without
/// those that are erased: an image that fits between the sections of the other one.
image::Image KeptBytes(const image::Image& image, const image::Image& contents);

/// Halts the target, reads all sectors that hold a byte of the image, and returns their KeptBytes.
image::Image ReadKeptBytes(FlashReader& reader, WorkMeter& meter, const image::Image& image,
                           const FlashGeometry& flash);

}  // namespace host
