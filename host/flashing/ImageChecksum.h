// The checksum that flash will have.

#pragma once

#include <cstdint>
#include <string>

#include "base/AddressRange.h"
#include "host/image/Image.h"

namespace host {

/// The CRC-32 of the range as flash would hold the image, erased where the image says nothing: what
/// the plug-in calculates of the range then.
std::uint32_t ImageChecksum(const image::Image& image, const base::AddressRange& range);

/// "0x0fe08dea": the form for people and programs of what the plug-in publishes, "fe08dea".
std::string ChecksumText(const std::string& digits);

}  // namespace host
