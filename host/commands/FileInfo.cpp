// Lines of a name and a value, as for a device.

#include "host/commands/FileInfo.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include "base/ByteOrder.h"
#include "base/Hex.h"
#include "host/flashing/ImageChecksum.h"
#include "host/targets/KnownDevices.h"

namespace host::commands {

namespace {

struct Vectors {
    std::uint32_t stack;
    std::uint32_t reset;
};

/// The first two words of flash, where the core finds its stack and its program after a reset.
std::optional<Vectors> VectorsOf(const image::Image& image) {
    const image::Section& first = image.Sections().front();
    if (first.address != 0 || first.bytes.size() < 8) return std::nullopt;
    const std::uint8_t* bytes = first.bytes.data();
    return Vectors{base::LoadWord(bytes), base::LoadWord(bytes + 4)};
}

/// The names of the classes whose usual flash holds the image, or doesn't.
std::vector<std::string> Classes(const image::Image& image, bool fitting) {
    std::vector<std::string> names;
    for (const KnownDevice& device : KnownDevices())
        if ((image.Sections().back().End() <= device.flashBytes) == fitting)
            names.push_back(fitting
                                ? device.name
                                : fmt::format("{} ({})", device.name, SizeText(device.flashBytes)));
    return names;
}

void ShowSections(Reporter& reporter, const image::Image& image) {
    const char* name = "Sections";
    for (const image::Section& section : image.Sections()) {
        reporter.Result(fmt::format("{:<11} {:<23} {}", name,
                                    RangeText({section.address, section.Last()}),
                                    SizeText(section.bytes.size())));
        name = "";
    }
}

void ShowFits(Reporter& reporter, const image::Image& image) {
    const auto fitting = Classes(image, true);
    const auto others = Classes(image, false);
    reporter.Result(
        fmt::format("{:<11} {}{}{}", "Fits",
                    fitting.empty() ? "no class" : fmt::format("{}", fmt::join(fitting, ", ")),
                    others.empty() ? "" : "; not ", fmt::join(others, ", ")));
}

Json SectionsJson(const image::Image& image) {
    Json sections = Json::array();
    for (const image::Section& section : image.Sections())
        sections.push_back({{"address", section.address}, {"bytes", section.bytes.size()}});
    return sections;
}

Json ShowFile(Reporter& reporter, const std::string& name, const image::ImageFile& file) {
    const image::Image& image = file.image;
    const base::AddressRange all{image.Sections().front().address, image.Sections().back().Last()};
    const std::uint32_t checksum = ImageChecksum(image, all);
    const auto vectors = VectorsOf(image);
    reporter.Result(fmt::format("{:<11} {}", "File", name));
    reporter.Result(fmt::format("{:<11} {}", "Format", image::FormatName(file.format)));
    ShowSections(reporter, image);
    if (file.entry) reporter.Result(fmt::format("{:<11} {:#x}", "Entry", *file.entry));
    if (vectors)
        reporter.Result(fmt::format("{:<11} stack {:#x}, reset {:#x}", "Vectors", vectors->stack,
                                    vectors->reset));
    reporter.Result(fmt::format("{:<11} {:#010x} of {}", "CRC-32", checksum, RangeText(all)));
    ShowFits(reporter, image);
    Json result{{"file", name},
                {"format", image::FormatName(file.format)},
                {"sections", SectionsJson(image)},
                {"bytes", image.ByteCount()},
                {"entry", file.entry ? Json(*file.entry) : Json(nullptr)},
                {"checksum", fmt::format("{:#010x}", checksum)},
                {"fits", Classes(image, true)}};
    result["vectors"] =
        vectors ? Json{{"stack", vectors->stack}, {"reset", vectors->reset}} : Json(nullptr);
    return result;
}

}  // namespace

Outcome ShowFiles(Context& context, const ImageFiles& files) {
    Json all = Json::array();
    const image::ReadOptions read = ReadOptionsOf(files);
    for (const std::string& file : files.files) {
        if (!all.empty()) context.reporter.Result("");
        all.push_back(ShowFile(context.reporter, file, ReadNamedFile(file, read)));
    }
    return {.result = {{"files", all}}};
}

}  // namespace host::commands
