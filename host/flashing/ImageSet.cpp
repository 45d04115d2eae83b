// Joining the files of a command, with a memory of what came from where.

#include "host/flashing/ImageSet.h"

#include <fmt/format.h>

#include <algorithm>

#include "host/base/Errors.h"
#include "host/driver/FlashDevice.h"

namespace host {

void LoadedImages::Add(const image::Image& added, const std::string& file) {
    for (const image::Section& section : added.Sections())
        origins.push_back({file, {section.address, section.Last()}});
    image.Add(added, file);
}

std::string LoadedImages::FileOf(std::uint32_t address) const {
    for (const auto& [file, range] : origins)
        if (range.first <= address && address <= range.last) return file;
    return Name();
}

std::string LoadedImages::Name() const {
    const auto differs = [&](const Origin& origin) { return origin.file != origins.front().file; };
    const bool several = std::any_of(origins.begin(), origins.end(), differs);
    return origins.empty() || several ? "the images" : origins.front().file;
}

LoadedImages ReadImages(const std::vector<std::string>& paths, const image::ReadOptions& options) {
    LoadedImages images;
    for (const std::string& path : paths)
        images.Add(image::ReadImageFile(path, options), path);
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
