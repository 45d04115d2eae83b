// What a program load will do, computed before anything is touched: which sections are handed to
// the plug-in, which sectors it will erase, how many bytes each phase moves.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "host/base/Text.h"
#include "host/image/Image.h"
#include "host/settings/SettingStore.h"

namespace host {

struct FlashGeometry {
    std::uint64_t flashBytes = 0;
    std::uint32_t sectorBytes = 0;
};

/// What a load erases, as the settings say it.
struct EraseChoice {
    enum class Kind { Necessary, Nothing, Everything, Range };

    Kind kind = Kind::Necessary;
    AddressRange range;  ///< of kind Range
};

struct ProgramPlan {
    std::vector<image::Section> sections;  ///< as handed to the plug-in, one loader start each
    std::vector<AddressRange> erased;      ///< runs of whole sectors, in address order
    std::uint64_t erasedBytes = 0;
    std::uint64_t sectorCount = 0;
    std::uint64_t imageBytes = 0;
    std::uint64_t transferBytes = 0;  ///< the sections, widened to the loader's blocks

    /// Bytes that are erased and don't belong to the image: they lose what they hold.
    std::uint64_t clearedBytes = 0;

    bool operator==(const ProgramPlan&) const = default;
};

/// The erase step of a load, from the settings as they are.
EraseChoice ChosenErase(const SettingStore& settings);

/// The whole sectors that hold a byte of the range.
AddressRange SectorsCovering(const AddressRange& range, std::uint32_t sectorBytes);

/// The image must lie in flash. Sections whose gap is short and erased anyway are joined.
ProgramPlan PlanProgram(const image::Image& image, const FlashGeometry& flash,
                        const EraseChoice& erase);

/// The lines that --dry-run shows.
std::vector<std::string> Describe(const ProgramPlan& plan, const FlashGeometry& flash);

}  // namespace host
