// Looking at flash before a load, and deciding what is left alone.

#include "host/flashing/Unchanged.h"

#include <algorithm>
#include <span>
#include <utility>

#include "host/facts/LoaderMemory.h"

namespace host {

namespace {

constexpr std::uint64_t kSamplesMin = 2;
constexpr std::uint64_t kSamplesMax = 8;

// What the plug-in's fixed pauses cost for another section and for a sector, and a chunk on a flash
// of ordinary speed; script/bench shows them.
constexpr std::uint64_t kLoaderStartMs = 110;
constexpr std::uint64_t kSectorMs = 20;
constexpr std::uint64_t kChunkMs = 10;

base::AddressRange BlockOf(std::uint32_t address) {
    return {address - address % plugin::kBlockBytes, address | (plugin::kBlockBytes - 1)};
}

/// The sector with that number, counted over the ranges of whole sectors.
base::AddressRange Sector(const base::AddressSet& sectors, std::uint64_t number,
                          const FlashGeometry& flash) {
    for (const base::AddressRange& run : sectors.Ranges()) {
        const std::uint64_t count = SectorCount(run, flash);
        if (number >= count) {
            number -= count;
            continue;
        }
        const auto first = static_cast<std::uint32_t>(run.first + number * flash.sectorBytes);
        return SectorsCovering({first, first}, flash);
    }
    return {};
}

/// The bytes of a range; none unless the image has all of them.
std::span<const std::uint8_t> BytesOf(const image::Image& image, const base::AddressRange& range) {
    const auto& sections = image.Sections();
    const auto section = std::ranges::partition_point(
        sections, [&](const image::Section& other) { return other.Last() < range.last; });
    if (section == sections.end() || section->address > range.first) return {};
    return std::span(section->bytes).subspan(range.first - section->address, range.Size());
}

bool HoldsASample(FlashReader& reader, const image::Image& image, const FlashGeometry& flash) {
    const auto holds = [&](const base::AddressRange& block) {
        return reader.ReadFlash(block) == ContentsAfterLoad(image, block);
    };
    return std::ranges::any_of(SampleBlocks(image, flash), holds);
}

}  // namespace

std::vector<std::uint8_t> ContentsAfterLoad(const image::Image& image,
                                            const base::AddressRange& range) {
    std::vector<std::uint8_t> contents(range.Size(), 0xFF);
    const auto& sections = image.Sections();
    auto section = std::ranges::partition_point(
        sections, [&](const image::Section& other) { return other.Last() < range.first; });
    for (; section != sections.end() && section->address <= range.last; ++section) {
        const std::uint32_t first = std::max(section->address, range.first);
        const std::uint32_t last = std::min(section->Last(), range.last);
        std::copy_n(section->bytes.begin() + (first - section->address),
                    std::size_t{last} - first + 1, contents.begin() + (first - range.first));
    }
    return contents;
}

std::vector<base::AddressRange> SampleBlocks(const image::Image& image,
                                             const FlashGeometry& flash) {
    const base::AddressSet sectors = SectorsOf(image, flash);
    std::uint64_t count = 0;
    for (const base::AddressRange& run : sectors.Ranges())
        count += SectorCount(run, flash);
    const std::uint64_t samples = std::min(count, std::clamp(count / 4, kSamplesMin, kSamplesMax));
    std::vector<base::AddressRange> blocks;
    for (std::uint64_t i = 0; i < samples; ++i) {
        const std::uint64_t number = samples == 1 ? 0 : i * (count - 1) / (samples - 1);
        const base::AddressRange sector = Sector(sectors, number, flash);
        const auto contents = ContentsAfterLoad(image, sector);
        const auto found = std::ranges::find_if(contents, [](auto byte) { return byte != 0xFF; });
        if (found != contents.end())
            blocks.push_back(
                BlockOf(sector.first + static_cast<std::uint32_t>(found - contents.begin())));
    }
    if (blocks.empty() && !image.Empty()) blocks.push_back(BlockOf(image.Sections()[0].address));
    return blocks;
}

base::AddressSet WorthLeaving(const base::AddressSet& unchanged, const base::AddressSet& sectors,
                              std::uint32_t sectorBytes) {
    base::AddressSet worth;
    for (const base::AddressRange& run : unchanged.Ranges()) {
        const std::uint64_t neighbours =
            (run.first == 0 ? 0 : sectors.BytesIn({run.first - 1, run.first - 1})) +
            sectors.BytesIn({run.last + 1, run.last + 1});
        const std::uint64_t alongMs =
            run.Size() / sectorBytes * kSectorMs + run.Size() * kChunkMs / plugin::kChunkBytes;
        if (neighbours < 2 || alongMs >= kLoaderStartMs) worth.Add(run);
    }
    return worth;
}

image::Image Without(const image::Image& image, const base::AddressSet& addresses) {
    image::Image rest;
    const auto add = [&](const image::Section& section, std::uint64_t first, std::uint64_t end) {
        if (first >= end) return;
        const auto from =
            section.bytes.begin() + static_cast<std::ptrdiff_t>(first - section.address);
        rest.Add(static_cast<std::uint32_t>(first),
                 {from, from + static_cast<std::ptrdiff_t>(end - first)}, "the image");
    };
    const auto& ranges = addresses.Ranges();
    for (const image::Section& section : image.Sections()) {
        std::uint64_t next = section.address;
        auto range = std::ranges::partition_point(
            ranges, [&](const base::AddressRange& other) { return other.last < section.address; });
        for (; range != ranges.end() && range->first < section.End(); ++range) {
            add(section, next, range->first);
            next = std::uint64_t{range->last} + 1;
        }
        add(section, next, section.End());
    }
    return rest;
}

base::AddressSet Unchanged(const image::Image& image, const image::Image& flashNow,
                           const FlashGeometry& flash) {
    const base::AddressSet sectors = SectorsOf(image, flash);
    base::AddressSet unchanged;
    for (const base::AddressRange& run : sectors.Ranges())
        for (std::uint64_t first = run.first; first <= run.last; first += flash.sectorBytes) {
            const auto address = static_cast<std::uint32_t>(first);
            const base::AddressRange sector = SectorsCovering({address, address}, flash);
            if (std::ranges::equal(BytesOf(flashNow, sector), ContentsAfterLoad(image, sector)))
                unchanged.Add(sector);
        }
    return WorthLeaving(unchanged, sectors, flash.sectorBytes);
}

FlashNow ReadForPlan(FlashReader& reader, WorkMeter& meter, const image::Image& image,
                     const FlashGeometry& flash) {
    reader.Halt();
    FlashNow now;
    if (!HoldsASample(reader, image, flash)) return now;
    const base::AddressSet sectors = SectorsOf(image, flash);
    meter.Expect(Phase::Look, sectors.Bytes());
    meter.Begin(Phase::Look);
    for (const base::AddressRange& range : sectors.Ranges()) {
        std::vector<std::uint8_t> wanted = ContentsAfterLoad(image, range);
        const bool holds = reader.HoldsByChecksum(range.first, wanted).value_or(false);
        now.byChecksum = now.byChecksum || holds;
        now.contents.Add(range.first, holds ? std::move(wanted) : reader.ReadFlash(range),
                         "the flash");
    }
    meter.End();
    return now;
}

}  // namespace host
