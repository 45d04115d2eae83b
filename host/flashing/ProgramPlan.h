// What a program load will do, computed before anything is touched: which sections are handed to
// the plug-in, which sectors it will erase, how many bytes each phase moves.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "base/AddressSet.h"
#include "host/flashing/Sectors.h"
#include "host/image/Image.h"
#include "host/settings/SettingStore.h"

namespace host {

/// What a load erases, as the settings say it.
struct EraseChoice {
    enum class Kind { Necessary, Nothing, Everything, Range };

    Kind kind = Kind::Necessary;
    base::AddressRange range;  ///< of kind Range
};

struct ProgramPlan {
    std::vector<image::Section> sections;    ///< as handed to the plug-in, one loader start each
    std::vector<base::AddressRange> erased;  ///< runs of whole sectors, in address order
    std::uint64_t erasedBytes = 0;
    std::uint64_t sectorCount = 0;
    std::uint64_t imageBytes = 0;
    std::uint64_t transferBytes = 0;  ///< the sections, widened to the loader's blocks

    /// Bytes that are erased and don't belong to the image: they lose what they hold.
    std::uint64_t clearedBytes = 0;

    bool erasesWhole = false;          ///< by one command for all of the flash
    base::AddressSet unchanged = {};   ///< sectors of the image that are left alone
    std::uint64_t unchangedBytes = 0;  ///< of the image, in these sectors

    bool operator==(const ProgramPlan&) const = default;
};

/// The erase step of a load, from the settings as they are.
EraseChoice ChosenErase(const SettingStore& settings);

/// Image and chosen range must lie in flash. The sectors in `unchanged` hold what they should.
/// Sections whose gap is short and erased anyway are joined. Where the necessary sectors are all of
/// the flash, it is erased whole.
ProgramPlan PlanProgram(const image::Image& image, const base::AddressSet& unchanged,
                        const FlashGeometry& flash, const EraseChoice& erase);

/// The lines that --dry-run shows.
std::vector<std::string> Describe(const ProgramPlan& plan, const FlashGeometry& flash);

}  // namespace host
