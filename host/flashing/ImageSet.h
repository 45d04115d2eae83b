// The image files of a command: read, joined, and shown to fit the device.

#pragma once

#include <string>
#include <vector>

#include "host/base/Text.h"
#include "host/image/Image.h"

namespace host {

class FlashDevice;

struct LoadedImages {
    image::Image image;

    /// Every section as it stood in its file, for saying which file doesn't fit.
    struct Origin {
        std::string file;
        AddressRange range;
    };
    std::vector<Origin> origins;

    /// Adds an image, which `file` names in what is said of it.
    void Add(const image::Image& added, const std::string& file);

    /// The file that a byte of the image stems from.
    std::string FileOf(std::uint32_t address) const;

    /// The file, or "the images" where there are several.
    std::string Name() const;
};

/// Reads the files and joins them.
LoadedImages ReadImages(const std::vector<std::string>& paths, const image::ReadOptions& options);

/// Asks the plug-in about the first and the last byte of every section. Failure (BadFile) names
/// the file and the section that doesn't lie in flash.
void RequireFit(FlashDevice& device, const LoadedImages& images);

}  // namespace host
