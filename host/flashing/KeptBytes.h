// What else the sectors of an image hold, so that it can be programmed back with the image.

#pragma once

#include "host/image/Image.h"

namespace host {

class FlashDevice;

/// Of the contents of the image's sectors, the bytes that the image says nothing about, without
/// those that are erased: an image that fits between the sections of the other one.
image::Image KeptBytes(const image::Image& image, const image::Image& contents);

/// Reads all sectors that hold a byte of the image. The target is halted first.
image::Image ReadSectors(FlashDevice& device, const image::Image& image);

}  // namespace host
