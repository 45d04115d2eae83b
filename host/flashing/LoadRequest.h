// What a load of an image is to do, as one value: taken from the settings, and changed by whoever
// asks for the load.

#pragma once

#include <chrono>

#include "base/AddressRange.h"

namespace host {

/// What a load erases first.
struct EraseChoice {
    enum class Kind { Necessary, Nothing, Everything, Range };

    Kind kind = Kind::Necessary;
    base::AddressRange range =
        {};  ///< of kind Range, as it was written: it may end before it starts

    bool operator==(const EraseChoice&) const = default;
};

/// What is looked at beside the bytes of the image.
struct LoadChecks {
    bool blankCheck = false;  ///< of each section, before it is programmed
    bool checksum = false;    ///< of the whole flash, afterwards
    bool compare = true;      ///< the image with the flash, afterwards

    bool operator==(const LoadChecks&) const = default;
};

/// How long the loader may take for a chunk; the plug-in uses the same limit for its polls of a
/// whole section together.
struct LoadTime {
    std::chrono::seconds limit{30};
    bool chosen = false;  ///< by the user, and so not to be made longer

    bool operator==(const LoadTime&) const = default;
};

struct LoadRequest {
    EraseChoice erase = {};
    LoadChecks checks = {};
    LoadTime time = {};
    bool rewrite = false;  ///< sectors that hold the image's bytes already are programmed, too
};

}  // namespace host
