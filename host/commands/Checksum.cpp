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

Outcome Answer(Context& context, const base::AddressRange& range, const std::string& checksum) {
    context.reporter.Result(checksum);
    return {.result = {{"checksum", checksum}, {"address", range.first}, {"bytes", range.Size()}}};
}

Outcome OfImage(Context& context, const ChecksumOptions& options) {
    const LoadedImages images = ReadNamed(context, {*options.imageFile}, options);
    return WithDevice(context, [&](FlashDevice& device) {
        RequireFit(device, device.Info(), images);
        const base::AddressRange range = device.RangeInFlash(options.range);
        return Answer(context, range, base::HexText(ImageChecksum(images.image, range)));
    });
}

Outcome OfFlash(Context& context, const ChecksumOptions& options) {
    return WithDevice(context, [&](FlashDevice& device) {
        const base::AddressRange range = ChooseRange(device, kChecksumKeys, options.range);
        const Outcome operation =
            RunOperation(device, plugin::kCalculateChecksum, Verbosity::Verbose);
        Outcome outcome = Answer(context, range, "0x" + device.Published(keys::kChecksumValue));
        outcome.result.update(operation.result);
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
        {RangeOption("The addresses to cover; default: the whole flash"),
         {&ChecksumOptions::imageFile,
          {"--of", "FILE", "Of this image file, not of the flash", Offers::Files}},
         FormatOption(),
         BaseOption()},
        RunChecksum);
}

}  // namespace host::commands
