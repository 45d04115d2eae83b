// Ranges of flash as the whole sectors that hold them.

#pragma once

#include <cstdint>

#include "base/AddressSet.h"
#include "host/image/Image.h"

namespace host {

/// The last sector may be cut short by the end of the flash.
struct FlashGeometry {
    std::uint64_t flashBytes = 0;
    std::uint32_t sectorBytes = 0;
    bool erasesWhole = false;  ///< one command can erase all of it
};

/// A range widened to whole units of so many bytes.
base::AddressRange Widened(const base::AddressRange& range, std::uint32_t unitBytes);

/// The sectors that hold a byte of the range, which lies in the flash.
base::AddressRange SectorsCovering(const base::AddressRange& range, const FlashGeometry& flash);

/// The same for a whole image.
base::AddressSet SectorsOf(const image::Image& image, const FlashGeometry& flash);

/// How many sectors a run of them has.
std::uint64_t SectorCount(const base::AddressRange& run, const FlashGeometry& flash);

}  // namespace host
