// The image files of a command: read, joined, and shown to fit the device.

#pragma once

#include <string>
#include <vector>

#include "host/CommandTable.h"
#include "host/Text.h"
#include "host/image/Image.h"

namespace host {

class FlashDevice;

/// Reads one file as --format and --base say.
image::Image ReadImage(const std::string& path, const Options& options);

struct LoadedImages {
    image::Image image;

    /// Every section as it stood in its file, for saying which file doesn't fit.
    struct Origin {
        std::string file;
        AddressRange range;
    };
    std::vector<Origin> origins;
};

/// Reads all files of the command and joins them.
LoadedImages ReadImages(const Options& options);

/// Asks the plug-in about the first and the last byte of every section. Failure (BadFile) names
/// the file and the section that doesn't lie in flash.
void RequireFit(FlashDevice& device, const LoadedImages& images);

}  // namespace host
