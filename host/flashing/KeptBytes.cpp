// Reading sectors, and taking the image out of them.

#include "host/flashing/KeptBytes.h"

#include <algorithm>

#include "host/flashing/ReadRanges.h"

namespace host {

namespace {

constexpr std::uint8_t kErased = 0xFF;

/// Adds what stands between two addresses, without the erased bytes at both ends: programming
/// those in between changes nothing, and costs less than one more section.
void AddGap(image::Image& kept, const image::Section& contents, std::uint64_t first,
            std::uint64_t end) {
    const auto at = [&](std::uint64_t address) {
        return contents.bytes.begin() + static_cast<std::ptrdiff_t>(address - contents.address);
    };
    if (first >= end) return;
    const auto holds = [](std::uint8_t byte) { return byte != kErased; };
    const auto from = std::find_if(at(first), at(end), holds);
    if (from == at(end)) return;
    const auto to =
        std::find_if(std::make_reverse_iterator(at(end)), std::make_reverse_iterator(from), holds);
    const auto offset = static_cast<std::uint32_t>(from - contents.bytes.begin());
    kept.Add(contents.address + offset, {from, to.base()}, "the flash");
}

}  // namespace

image::Image KeptBytes(const image::Image& image, const image::Image& contents) {
    image::Image kept;
    auto section = image.Sections().begin();
    for (const image::Section& run : contents.Sections()) {
        std::uint64_t next = run.address;
        for (; section != image.Sections().end() && section->address < run.End(); ++section) {
            AddGap(kept, run, next, std::max<std::uint64_t>(section->address, next));
            next = section->End();
        }
        AddGap(kept, run, next, run.End());
    }
    return kept;
}

image::Image ReadKeptBytes(FlashReader& reader, WorkMeter& meter, const image::Image& image,
                           const FlashGeometry& flash) {
    reader.Halt();
    return KeptBytes(image, ReadRanges(reader, meter, Phase::Read, SectorsOf(image, flash)));
}

}  // namespace host
