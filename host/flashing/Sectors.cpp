// Rounding to sectors.

#include "host/flashing/Sectors.h"

namespace host {

AddressRange SectorsCovering(const AddressRange& range, std::uint32_t sectorBytes) {
    return {range.first - range.first % sectorBytes,
            range.last - range.last % sectorBytes + (sectorBytes - 1)};
}

AddressSet SectorsOf(const image::Image& image, std::uint32_t sectorBytes) {
    AddressSet sectors;
    for (const image::Section& section : image.Sections())
        sectors.Add(SectorsCovering({section.address, section.Last()}, sectorBytes));
    return sectors;
}

}  // namespace host
