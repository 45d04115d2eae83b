// corvane-flash verify: compare flash with image files.

#include <fmt/format.h>

#include <limits>

#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/Comparison.h"
#include "host/flashing/ImageSet.h"
#include "host/flashing/RangeOperation.h"
#include "host/output/Summary.h"

namespace host::commands {

namespace {

struct VerifyOptions : ImageFiles, RangeChoice, ComparisonKind {
    bool list = false;
};

std::string EqualText(const image::Image& all, const image::Image& compared,
                      const std::vector<base::AddressRange>& ranges) {
    if (compared == all) return "The flash holds the image";
    return fmt::format("The flash holds the image in {}: {} of {} were compared",
                       RangesText(ranges), compared.ByteCount(),
                       CountText(all.ByteCount(), "byte"));
}

Outcome VerifyOn(Context& context, FlashDevice& device, const LoadedImages& all,
                 const VerifyOptions& options) {
    const ChosenRanges chosen = ChooseJoinedRanges(device, options.ranges);
    const LoadedImages images = chosen.isWholeFlash ? all : Within(all, chosen.ranges);
    RequireFit(device, device.Info(), images);
    ApplyTo(device, options);
    device.Meter().Expect(Phase::Verify, images.image.ByteCount());
    const std::size_t shown =
        options.list ? std::numeric_limits<std::size_t>::max() : Differences::kRangesShown;
    const Differences differences = CompareWithFlash(device, device.Meter(), images.image, shown);
    const bool equal = differences.Empty();
    Outcome outcome{.result = {{"equal", equal},
                               {"imageBytes", all.image.ByteCount()},
                               {"comparedBytes", images.image.ByteCount()},
                               {"comparedBy", ComparedBy(differences)},
                               {"phases", PhasesJson(device.Meter().Phases())}}};
    ShowSummary(context.reporter, device.Meter().Phases());
    if (equal)
        context.reporter.Result(EqualText(all.image, images.image, chosen.ranges) +
                                ByChecksumText(differences.byChecksum));
    else
        FailAsDifferent(outcome, differences, images, "");
    return outcome;
}

Outcome RunVerify(Context& context, const VerifyOptions& options) {
    const LoadedImages images = ReadNamed(context, options.files, options);
    return WithDevice(
        context, [&](FlashDevice& device) { return VerifyOn(context, device, images, options); });
}

}  // namespace

CommandRow Verify() {
    return Command<VerifyOptions>(
        {.name = "verify",
         .help = "Compare flash with image files",
         .details = "The exit status is 5 when a byte differs.",
         .example = "  corvane-flash verify firmware.elf"},
        {ImagesArgument(true),
         FormatOption(),
         BaseOption(),
         RangeOption("Compare only these addresses; default: all of the "
                     "image; may be repeated"),
         {&VerifyOptions::list,
          {"--list", "", "List every range that differs, not the first ones alone"}},
         CompareOption()},
        RunVerify);
}

}  // namespace host::commands
