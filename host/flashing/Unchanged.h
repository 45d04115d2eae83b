// What needs no work: sectors of an image that already hold what a load would leave in them.

#pragma once

#include <cstdint>
#include <vector>

#include "base/AddressSet.h"
#include "host/driver/FlashReader.h"
#include "host/flashing/Sectors.h"
#include "host/image/Image.h"
#include "host/output/WorkMeter.h"

namespace host {

/// What a load of the necessary sectors leaves in a range of them: the image's bytes, and 0xFF
/// elsewhere.
std::vector<std::uint8_t> ContentsAfterLoad(const image::Image& image,
                                            const base::AddressRange& range);

/// What is known of the flash before a load.
struct FlashNow {
    image::Image contents = {};
    bool byChecksum = false;  ///< some of it wasn't read, for its CRC-32 was right
};

/// A few blocks spread over the image that erased flash doesn't hold, as far as there are any.
std::vector<base::AddressRange> SampleBlocks(const image::Image& image, const FlashGeometry& flash);

/// Of the sectors that hold what they should, those that are worth leaving alone. Others lie
/// between two that must be programmed, and take less time than one more start of the loader.
base::AddressSet WorthLeaving(const base::AddressSet& unchanged, const base::AddressSet& sectors,
                              std::uint32_t sectorBytes);

/// The image without the bytes that lie in a set.
image::Image Without(const image::Image& image, const base::AddressSet& addresses);

/// The sectors of the image that hold what they should by what was read of the flash, and are worth
/// leaving alone.
base::AddressSet Unchanged(const image::Image& image, const image::Image& flashNow,
                           const FlashGeometry& flash);

/// What the image's sectors hold, to see which of them can be left alone. Unless one of the samples
/// holds the image's bytes, nothing else is read and nothing returned; what has the right CRC-32
/// isn't read. The target is halted first.
FlashNow ReadForPlan(FlashReader& reader, WorkMeter& meter, const image::Image& image,
                     const FlashGeometry& flash);

}  // namespace host
