// See Images.h.

#include "host/commands/Images.h"

#include <fmt/format.h>

#include "host/Errors.h"
#include "host/FlashDevice.h"

namespace host {

image::Image ReadImage(const std::string& path, const Options& options) {
    image::ReadOptions read;
    if (options.format) read.format = image::FormatFromName(*options.format);
    if (options.base) read.base = ParseHexArgument(*options.base, "--base");
    return image::ReadImageFile(path, read);
}

LoadedImages ReadImages(const Options& options) {
    LoadedImages images;
    for (const std::string& path : options.files) {
        const image::Image image = ReadImage(path, options);
        for (const image::Section& section : image.Sections())
            images.origins.push_back({path, {section.address, section.Last()}});
        images.image.Add(image, path);
    }
    return images;
}

void RequireFit(FlashDevice& device, const LoadedImages& images) {
    for (const auto& [file, range] : images.origins) {
        if (device.Contains(range.first) && device.Contains(range.last)) continue;
        const DeviceInfo& info = device.Info();
        const std::string flash = info.hasFlash ? "the flash, " + RangeText(info.Flash())
                                                : "flash: the device has none to program";
        throw Failure(ExitStatus::BadFile,
                      fmt::format("{}: the section {} doesn't lie in {}; nothing was touched; is "
                                  "the image linked for this device ({})?",
                                  file, RangeText(range), flash, info.family));
    }
}

}  // namespace host
