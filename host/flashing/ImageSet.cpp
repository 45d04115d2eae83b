// Joining the files of a command, with a memory of what came from where.

#include "host/flashing/ImageSet.h"

#include <fmt/format.h>

#include <algorithm>

#include "base/Hex.h"
#include "base/system/Files.h"
#include "host/base/Errors.h"
#include "host/base/Text.h"

namespace host {

void LoadedImages::Add(const image::Image& added, const std::string& file) {
    for (const image::Section& section : added.Sections())
        origins.push_back({file, {section.address, section.Last()}});
    image.Add(added, file);
}

std::string LoadedImages::FileOf(std::uint32_t address) const {
    for (const auto& [file, range] : origins)
        if (range.Contains(address)) return file;
    return Name();
}

std::string LoadedImages::Name() const {
    const auto differs = [&](const Origin& origin) { return origin.file != origins.front().file; };
    const bool several = std::any_of(origins.begin(), origins.end(), differs);
    return origins.empty() || several ? "the images" : origins.front().file;
}

NamedFile SplitAddress(const std::string& text) {
    const std::size_t at = text.rfind('@');
    if (at == std::string::npos || base::StatusOf(text)) return {text, {}};
    const std::string behind = text.substr(at + 1);
    if (const auto address = base::ParseHex32(behind)) return {text.substr(0, at), address};
    throw Failure(
        ExitStatus::WrongUsage,
        fmt::format("there is no file {}, and '{}' behind its @ is no hexadecimal address "
                    "of up to 32 bits",
                    text, behind));
}

namespace {

std::optional<base::AddressRange> Overlap(const base::AddressRange& one,
                                          const base::AddressRange& other) {
    const base::AddressRange both{std::max(one.first, other.first), std::min(one.last, other.last)};
    return both.first <= both.last ? std::optional(both) : std::nullopt;
}

void AddWithin(LoadedImages& within, const LoadedImages& images, const base::AddressRange& range) {
    bool found = false;
    for (const image::Section& section : images.image.Sections()) {
        const auto part = Overlap({section.address, section.Last()}, range);
        if (!part) continue;
        found = true;
        const auto begin = section.bytes.begin() + (part->first - section.address);
        const auto end = section.bytes.begin() + (part->last - section.address) + 1;
        within.image.Add(part->first, {begin, end}, images.Name());
    }
    if (!found)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{}: no bytes in the range {}", images.Name(), RangeText(range)));
    for (const LoadedImages::Origin& origin : images.origins)
        if (const auto part = Overlap(origin.range, range))
            within.origins.push_back({origin.file, *part});
}

}  // namespace

LoadedImages Within(const LoadedImages& images, const std::vector<base::AddressRange>& ranges) {
    LoadedImages within;
    for (const base::AddressRange& range : ranges)
        AddWithin(within, images, range);
    return within;
}

namespace {

/// The raw binaries among the files, by whether they have an address of their own.
struct RawBinaries {
    std::vector<std::string> placed;
    std::vector<std::string> unplaced;
};

/// Two would lie on each other.
void RequireNoSecond(const RawBinaries& raw) {
    if (raw.unplaced.size() > 1)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("--base is for one raw binary, not for {} and {}; write "
                                  "FILE@ADDRESS for each",
                                  raw.unplaced[0], raw.unplaced[1]));
}

void RequireUseForBase(const RawBinaries& raw) {
    if (!raw.unplaced.empty()) return;
    throw Failure(ExitStatus::WrongUsage,
                  raw.placed.empty()
                      ? "--base says where a raw binary goes, and there is none; leave it out, or "
                        "say --format bin"
                      : fmt::format("--base says where a raw binary goes, and {} has its address "
                                    "behind the @ already; leave one of the two out",
                                    raw.placed.front()));
}

}  // namespace

image::ImageFile ReadNamedFile(const std::string& text, const image::ReadOptions& options) {
    const auto [path, address] = SplitAddress(text);
    image::ImageFile file =
        image::ReadImageFile(path, {options.format, address ? address : options.base});
    if (address && file.format != image::Format::Binary)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{}: the file is no raw binary ({}) and has addresses of its "
                                  "own; leave the address out, or say --format bin",
                                  text, image::FormatName(file.format)));
    return file;
}

LoadedImages ReadImages(const std::vector<std::string>& paths, const image::ReadOptions& options) {
    if (paths.empty() && (options.base || options.format))
        throw Failure(ExitStatus::WrongUsage,
                      "--base and --format say how an image file is read, and none is named");
    LoadedImages images;
    RawBinaries raw;
    for (const std::string& text : paths) {
        const auto [path, address] = SplitAddress(text);
        const image::ImageFile file = ReadNamedFile(text, options);
        if (file.format == image::Format::Binary)
            (address ? raw.placed : raw.unplaced).push_back(path);
        RequireNoSecond(raw);
        images.Add(file.image, path);
    }
    if (options.base) RequireUseForBase(raw);
    return images;
}

void RequireFit(FlashReader& reader, const DeviceInfo& info, const LoadedImages& images) {
    for (const auto& [file, range] : images.origins) {
        if (reader.Contains(range.first) && reader.Contains(range.last)) continue;
        const std::string flash = info.hasFlash ? "the flash, " + RangeText(info.Flash())
                                                : "flash: the device has none to program";
        throw Failure(ExitStatus::BadFile,
                      fmt::format("{}: the section {} doesn't lie in {}; nothing was touched; is "
                                  "the image linked for this device ({})?",
                                  file, RangeText(range), flash, info.family));
    }
}

}  // namespace host
