// From a request, an image and what flash holds to a plan; no device is needed.

#include "host/flashing/LoadPlan.h"

#include <fmt/format.h>

#include <algorithm>
#include <iterator>

#include "host/base/Text.h"
#include "host/facts/LoaderMemory.h"
#include "host/flashing/Unchanged.h"

namespace host {

namespace {

using plugin::kBlockBytes;
using plugin::kChunkBytes;

/// The longest gap that is cheaper to fill than to start the loader once more for: one chunk.
constexpr std::uint64_t kGapBytesMax = kChunkBytes;

std::vector<base::AddressRange> ErasedRuns(const image::Image& image, const FlashGeometry& flash,
                                           const EraseChoice& erase) {
    using Kind = EraseChoice::Kind;
    if (erase.kind == Kind::Everything)
        return {{0, static_cast<std::uint32_t>(flash.flashBytes - 1)}};
    if (erase.kind == Kind::Range && erase.range.first <= erase.range.last)
        return {SectorsCovering(erase.range, flash)};
    if (erase.kind == Kind::Necessary) return SectorsOf(image, flash).Ranges();
    return {};
}

/// One command in place of one for each of all the sectors.
bool ErasesWhole(const std::vector<base::AddressRange>& erased, const FlashGeometry& flash,
                 const EraseChoice& erase) {
    if (erase.kind == EraseChoice::Kind::Everything) return true;
    return erase.kind == EraseChoice::Kind::Necessary && flash.erasesWhole &&
           flash.flashBytes > flash.sectorBytes && erased.size() == 1 && erased[0].first == 0 &&
           std::uint64_t{erased[0].last} + 1 == flash.flashBytes;
}

/// How many bytes of a range are erased. The runs are either one, or whole sectors of which each
/// section lies in one run, so that the last run that starts in or before the range is the one.
std::uint64_t ErasedBytes(const base::AddressRange& range,
                          const std::vector<base::AddressRange>& runs) {
    const auto behind = std::upper_bound(
        runs.begin(), runs.end(), range.last,
        [](std::uint32_t last, const base::AddressRange& run) { return last < run.first; });
    if (behind == runs.begin()) return 0;
    const base::AddressRange& run = *std::prev(behind);
    const std::uint64_t first = std::max(run.first, range.first);
    const std::uint64_t end = std::uint64_t{std::min(run.last, range.last)} + 1;
    return end > first ? end - first : 0;
}

/// Whether the bytes between two sections are few and hold 0xFF when the load begins. Writing 0xFF
/// over them then leaves the same flash with one loader start less.
bool CanFill(const image::Section& section, const image::Section& next,
             const std::vector<base::AddressRange>& erased) {
    const base::AddressRange gap{section.Last() + 1, next.address - 1};
    return gap.Size() <= kGapBytesMax && ErasedBytes(gap, erased) == gap.Size();
}

std::vector<image::Section> Join(const image::Image& image,
                                 const std::vector<base::AddressRange>& erased) {
    std::vector<image::Section> joined;
    for (const image::Section& section : image.Sections()) {
        if (joined.empty() || !CanFill(joined.back(), section, erased)) {
            joined.push_back(section);
            continue;
        }
        std::vector<std::uint8_t>& bytes = joined.back().bytes;
        bytes.resize(section.address - joined.back().address, 0xFF);
        bytes.insert(bytes.end(), section.bytes.begin(), section.bytes.end());
    }
    return joined;
}

std::uint64_t WidenedBytes(const image::Section& section) {
    const std::uint64_t first = section.address / kBlockBytes;
    const std::uint64_t last = section.Last() / kBlockBytes;
    return (last - first + 1) * kBlockBytes;
}

/// The plug-in's limit is for its polls of a section together, so a fixed one would fail large
/// images on slow flash: each chunk may cost two polls more, unless the user has set a limit.
std::chrono::seconds SectionTime(const LoadTime& time, std::uint64_t transferBytes) {
    constexpr std::uint64_t kChunksPerSecond = 5;
    if (time.chosen) return time.limit;
    return time.limit + std::chrono::seconds(transferBytes / (kChunkBytes * kChunksPerSecond));
}

}  // namespace

LoadPlan PlanLoad(const LoadRequest& request, const image::Image& image,
                  const image::Image& flashNow, const FlashGeometry& flash) {
    LoadPlan plan;
    plan.unchanged = Unchanged(image, flashNow, flash);
    const image::Image changed = Without(image, plan.unchanged);
    plan.erased = ErasedRuns(changed, flash, request.erase);
    plan.erase = ErasesWhole(plan.erased, flash, request.erase)
                     ? EraseChoice{EraseChoice::Kind::Everything}
                     : request.erase;
    plan.checks = request.checks;
    plan.sections = Join(changed, plan.erased);
    plan.imageBytes = image.ByteCount();
    plan.unchangedBytes = plan.imageBytes - changed.ByteCount();
    for (const image::Section& section : plan.sections)
        plan.transferBytes += WidenedBytes(section);
    for (const base::AddressRange& run : plan.erased) {
        plan.erasedBytes += run.Size();
        plan.sectorCount += SectorCount(run, flash);
    }
    plan.clearedBytes = plan.erasedBytes;
    for (const image::Section& section : changed.Sections())
        plan.clearedBytes -= ErasedBytes({section.address, section.Last()}, plan.erased);
    plan.chunkTime = request.time.limit;
    plan.sectionTime = SectionTime(request.time, plan.transferBytes);
    return plan;
}

void ExpectLoad(WorkMeter& meter, const LoadPlan& plan, const FlashGeometry& flash) {
    meter.Expect(Phase::Erase, plan.erasedBytes);
    meter.Expect(Phase::Program, plan.transferBytes);
    if (plan.checks.blankCheck)
        for (const image::Section& section : plan.sections)
            meter.Expect(Phase::BlankCheck, Widened({section.address, section.Last()}, 4).Size());
    if (plan.checks.checksum) meter.Expect(Phase::Checksum, flash.flashBytes);
    if (plan.checks.compare) meter.Expect(Phase::Verify, plan.imageBytes);
}

std::vector<std::string> Describe(const LoadPlan& plan, const FlashGeometry& flash) {
    std::vector<std::string> lines;
    for (const base::AddressRange& run : plan.erased)
        lines.push_back(fmt::format("erase    {:<23} {}{}", RangeText(run),
                                    CountText(SectorCount(run, flash), "sector"),
                                    plan.ErasesWhole() ? ", all at once" : ""));
    if (plan.erased.empty()) lines.emplace_back("erase    nothing");
    for (const image::Section& section : plan.sections)
        lines.push_back(fmt::format("program  {:<23} {}",
                                    RangeText({section.address, section.Last()}),
                                    SizeText(section.bytes.size())));
    for (const base::AddressRange& run : plan.unchanged.Ranges())
        lines.push_back(fmt::format("leave    {:<23} {} with the image in place", RangeText(run),
                                    CountText(SectorCount(run, flash), "sector")));
    lines.push_back(
        fmt::format("{} of the image; {} more are cleared with its sectors; {} of "
                    "flash are not erased",
                    SizeText(plan.imageBytes), SizeText(plan.clearedBytes),
                    SizeText(flash.flashBytes - plan.erasedBytes)));
    return lines;
}

Json ToJson(const LoadPlan& plan) {
    Json sections = Json::array();
    for (const image::Section& section : plan.sections)
        sections.push_back({{"address", section.address}, {"bytes", section.bytes.size()}});
    Json erased = Json::array();
    for (const base::AddressRange& run : plan.erased)
        erased.push_back({{"address", run.first}, {"bytes", run.Size()}});
    return {{"sections", sections},
            {"erased", erased},
            {"sectors", plan.sectorCount},
            {"imageBytes", plan.imageBytes},
            {"unchangedBytes", plan.unchangedBytes},
            {"clearedBytes", plan.clearedBytes}};
}

}  // namespace host
