// Rounding to sectors.

#include "host/flashing/Sectors.h"

#include <algorithm>

namespace host {

base::AddressRange Widened(const base::AddressRange& range, std::uint32_t unitBytes) {
    return {range.first - range.first % unitBytes,
            range.last - range.last % unitBytes + (unitBytes - 1)};
}

base::AddressRange SectorsCovering(const base::AddressRange& range, const FlashGeometry& flash) {
    const base::AddressRange sectors = Widened(range, flash.sectorBytes);
    return {sectors.first,
            std::min(sectors.last, static_cast<std::uint32_t>(flash.flashBytes - 1))};
}

base::AddressSet SectorsOf(const image::Image& image, const FlashGeometry& flash) {
    base::AddressSet sectors;
    for (const image::Section& section : image.Sections())
        sectors.Add(SectorsCovering({section.address, section.Last()}, flash));
    return sectors;
}

std::uint64_t SectorCount(const base::AddressRange& run, const FlashGeometry& flash) {
    return (run.Size() + flash.sectorBytes - 1) / flash.sectorBytes;
}

}  // namespace host
