// What a load will do, computed before anything is touched: which sections are handed to the
// plug-in, which sectors it will erase, how many bytes each phase moves.

#pragma once

#include <chrono>
#include <cstdint>
#include <string>
#include <vector>

#include "base/AddressSet.h"
#include "host/base/Json.h"
#include "host/flashing/LoadRequest.h"
#include "host/flashing/Sectors.h"
#include "host/image/Image.h"
#include "host/output/WorkMeter.h"

namespace host {

struct LoadPlan {
    std::vector<image::Section> sections = {};  ///< as handed to the plug-in, one loader start each
    std::vector<base::AddressRange> erased = {};  ///< runs of whole sectors, in address order
    std::uint64_t erasedBytes = 0;
    std::uint64_t sectorCount = 0;
    std::uint64_t imageBytes = 0;
    std::uint64_t transferBytes = 0;  ///< the sections, widened to the loader's blocks

    /// Bytes that are erased and don't belong to the image: they lose what they hold.
    std::uint64_t clearedBytes = 0;

    EraseChoice erase = {};  ///< Everything: by one command for all of the flash
    LoadChecks checks = {};

    std::chrono::seconds chunkTime{};    ///< that the loader may take for the last chunk
    std::chrono::seconds sectionTime{};  ///< for the plug-in's polls of a section together

    base::AddressSet unchanged = {};   ///< sectors of the image that are left alone
    std::uint64_t unchangedBytes = 0;  ///< of the image, in these sectors
    bool lookedByChecksum = false;     ///< some are known by their CRC-32 alone

    bool ErasesWhole() const { return erase.kind == EraseChoice::Kind::Everything; }
    bool operator==(const LoadPlan&) const = default;
};

/// `flashNow` is what of the flash was read; what wasn't counts as different from the image. Image
/// and chosen range must lie in flash. Sections whose gap is short and erased anyway are joined.
/// Where the necessary sectors are all of the flash, it is erased whole.
LoadPlan PlanLoad(const LoadRequest& request, const image::Image& image,
                  const image::Image& flashNow, const FlashGeometry& flash);

/// Announces the work of a plan, so that its progress has totals.
void ExpectLoad(WorkMeter& meter, const LoadPlan& plan, const FlashGeometry& flash);

/// The lines that --dry-run shows.
std::vector<std::string> Describe(const LoadPlan& plan, const FlashGeometry& flash);

Json ToJson(const LoadPlan& plan);

}  // namespace host
