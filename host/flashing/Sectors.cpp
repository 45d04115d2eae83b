// Rounding to sectors.

#include "host/flashing/Sectors.h"

#include <algorithm>

namespace host {

AddressRange Widened(const AddressRange& range, std::uint32_t unitBytes) {
    return {range.first - range.first % unitBytes,
            range.last - range.last % unitBytes + (unitBytes - 1)};
}

AddressRange SectorsCovering(const AddressRange& range, const FlashGeometry& flash) {
    const AddressRange sectors = Widened(range, flash.sectorBytes);
    return {sectors.first,
            std::min(sectors.last, static_cast<std::uint32_t>(flash.flashBytes - 1))};
}

AddressSet SectorsOf(const image::Image& image, const FlashGeometry& flash) {
    AddressSet sectors;
    for (const image::Section& section : image.Sections())
        sectors.Add(SectorsCovering({section.address, section.Last()}, flash));
    return sectors;
}

std::uint64_t SectorCount(const AddressRange& run, const FlashGeometry& flash) {
    return (run.Size() + flash.sectorBytes - 1) / flash.sectorBytes;
}

}  // namespace host
