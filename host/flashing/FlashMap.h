// A map of the flash: which parts are blank or in use, and what a load would do to each; as runs of
// addresses, and as a picture of characters.

#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "host/base/Json.h"
#include "host/base/Text.h"
#include "host/driver/FlashReader.h"
#include "host/flashing/LoadPlan.h"
#include "host/image/Image.h"
#include "host/output/Reporter.h"
#include "host/output/WorkMeter.h"

namespace host {

/// From what matters least to what matters most where one character stands for several.
enum class MapState {
    Blank,    ///< holds nothing, and gets nothing
    Used,     ///< holds something that stays
    Held,     ///< holds the image's bytes already
    Program,  ///< gets the image's bytes
    Cleared,  ///< holds something that a load erases, and that isn't the image's
    Blocked,  ///< can't get the image's bytes: bits of it are 0 and aren't erased
};

struct MapRun {
    base::AddressRange range;
    MapState state = MapState::Blank;

    bool operator==(const MapRun&) const = default;
};

/// Runs in address order that cover the whole flash. `contents` is all of it; without an image,
/// `plan` is the empty one. Outside of the image, a run begins and ends with a sector.
std::vector<MapRun> MapFlash(const std::vector<std::uint8_t>& contents, const FlashGeometry& flash,
                             const image::Image& image, const LoadPlan& plan);

/// The picture, at most `columns` wide and about a screen high, and what its characters mean.
std::vector<std::string> DrawMap(const std::vector<MapRun>& runs, const FlashGeometry& flash,
                                 std::size_t columns);

Json ToJson(const std::vector<MapRun>& runs);

/// Halts the target and reads all of the flash.
std::vector<std::uint8_t> ReadAll(FlashReader& reader, WorkMeter& meter,
                                  const FlashGeometry& flash);

/// Shows the map of these contents, and returns its runs for the JSON lines.
Json ShowMap(Reporter& reporter, const std::vector<std::uint8_t>& contents,
             const FlashGeometry& flash, const image::Image& image, const LoadPlan& plan);

}  // namespace host
