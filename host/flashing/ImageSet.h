// The image files of a command: read, joined, and shown to fit the device.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "host/base/Text.h"
#include "host/driver/DeviceInfo.h"
#include "host/driver/FlashReader.h"
#include "host/image/Image.h"

namespace host {

struct LoadedImages {
    image::Image image;

    /// Every section as it stood in its file, for saying which file doesn't fit.
    struct Origin {
        std::string file;
        base::AddressRange range;
    };
    std::vector<Origin> origins;

    /// Adds an image, which `file` names in what is said of it.
    void Add(const image::Image& added, const std::string& file);

    /// The file that a byte of the image stems from.
    std::string FileOf(std::uint32_t address) const;

    /// The file, or "the images" where there are several.
    std::string Name() const;
};

/// A file as the command line names it: "FILE", or "FILE@ADDRESS" for raw binary with a place of
/// its own. A file whose name has that form is taken as it is.
struct NamedFile {
    std::string path;
    std::optional<std::uint32_t> address;
};
NamedFile SplitAddress(const std::string& text);

/// Reads a file that is named so. Failure (WrongUsage) for an address that isn't that of a raw
/// binary.
image::ImageFile ReadNamedFile(const std::string& text, const image::ReadOptions& options);

/// What of the images lies in some ranges. Failure (WrongUsage) when it is nothing for one of them.
LoadedImages Within(const LoadedImages& images, const std::vector<base::AddressRange>& ranges);

/// Reads the files and joins them. Failure (WrongUsage) for a second raw binary without a
/// place of its own.
LoadedImages ReadImages(const std::vector<std::string>& paths, const image::ReadOptions& options);

/// Asks about the first and the last byte of every section. Failure (BadFile) names the file and
/// the section that doesn't lie in flash.
void RequireFit(FlashReader& reader, const DeviceInfo& info, const LoadedImages& images);

}  // namespace host
