// The checksum that flash will have.

#pragma once

#include <cstdint>

#include "base/AddressRange.h"
#include "host/image/Image.h"

namespace host {

/// The CRC-32 of the range as flash would hold the image, erased where the image says nothing: what
/// the plug-in calculates of the range then.
std::uint32_t ImageChecksum(const image::Image& image, const base::AddressRange& range);

}  // namespace host
