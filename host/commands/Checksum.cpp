// corvane-flash checksum: the CRC-32 of flash by the plug-in, or of an image by the host.

#include <fmt/format.h>

#include "base/Hex.h"
#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/driver/FlashDevice.h"
#include "host/facts/SettingKeys.h"
#include "host/flashing/ImageChecksum.h"
#include "host/flashing/ImageSet.h"
#include "host/flashing/RangeOperation.h"

namespace host::commands {

namespace {

struct ChecksumOptions : RangeChoice, ImageForm {
    std::optional<std::string> imageFile;
};

struct RangeChecksum {
    base::AddressRange range;
    std::string checksum;
};

/// Of one range, the checksum alone; of several, a line for each that names it.
Json Answer(Reporter& reporter, const std::vector<RangeChecksum>& found) {
    const bool single = found.size() == 1;
    Json ranges = Json::array();
    for (const auto& [range, checksum] : found) {
        reporter.Result(single ? checksum : fmt::format("{:<10}  {}", checksum, RangeText(range)));
        ranges.push_back(
            {{"checksum", checksum}, {"address", range.first}, {"bytes", range.Size()}});
    }
    Json result = single ? ranges[0] : Json::object();
    result["ranges"] = std::move(ranges);
    return result;
}

Outcome OfImage(Context& context, const ChecksumOptions& options) {
    const LoadedImages images = ReadNamed(context, {*options.imageFile}, options);
    return WithDevice(context, [&](FlashDevice& device) {
        RequireFit(device, device.Info(), images);
        std::vector<RangeChecksum> found;
        for (const base::AddressRange& range : ChooseRanges(device, options.ranges).ranges)
            found.push_back({range, fmt::format("{:#010x}", ImageChecksum(images.image, range))});
        return Outcome{.result = Answer(context.reporter, found)};
    });
}

Outcome OfFlash(Context& context, const ChecksumOptions& options) {
    return WithDevice(context, [&](FlashDevice& device) {
        std::vector<RangeChecksum> found;
        const auto note = [&](const base::AddressRange& range) {
            found.push_back({range, ChecksumText(device.Published(keys::kChecksumValue))});
        };
        const Outcome operation =
            RunOverRanges(device, plugin::kCalculateChecksum, ChooseRanges(device, options.ranges),
                          {.afterEach = note});
        Outcome outcome{.result = Answer(context.reporter, found)};
        for (const char* member : {"operation", "phases"})
            outcome.result[member] = operation.result[member];
        return outcome;
    });
}

Outcome RunChecksum(Context& context, const ChecksumOptions& options) {
    if (options.imageFile) return OfImage(context, options);
    ReadNamed(context, {}, options);  // refuses what only images have
    return OfFlash(context, options);
}

}  // namespace

CommandRow Checksum() {
    return Command<ChecksumOptions>(
        {.name = "checksum",
         .help = "Calculate the CRC-32 of the flash, a range or an image",
         .details = "With --of, the host computes what the device would answer if its flash held "
                    "the image and nothing else.",
         .example = "  corvane-flash checksum\n"
                    "  corvane-flash checksum --of firmware.elf"},
        {RangeOption("The addresses to cover; default: the whole flash; repeated, each has a "
                     "checksum of its own"),
         {&ChecksumOptions::imageFile,
          {"--of", "FILE", "Of this image file, not of the flash", Offers::Files}},
         FormatOption(),
         BaseOption()},
        RunChecksum);
}

}  // namespace host::commands
