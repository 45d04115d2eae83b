// Ranges of flash as the whole sectors that hold them.

#pragma once

#include <cstdint>

#include "host/base/AddressSet.h"
#include "host/image/Image.h"

namespace host {

struct FlashGeometry {
    std::uint64_t flashBytes = 0;
    std::uint32_t sectorBytes = 0;
    bool erasesWhole = false;  ///< one command can erase all of it
};

/// The whole sectors that hold a byte of the range.
AddressRange SectorsCovering(const AddressRange& range, std::uint32_t sectorBytes);

/// The same for a whole image.
AddressSet SectorsOf(const image::Image& image, std::uint32_t sectorBytes);

}  // namespace host
