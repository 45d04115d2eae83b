// corvane-flash verify: compare flash with image files.

#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/Comparison.h"
#include "host/flashing/ImageSet.h"
#include "host/output/Summary.h"

namespace host::commands {

namespace {

struct VerifyOptions : ImageFiles, RangeChoice {};

Outcome VerifyOn(Context& context, FlashDevice& device, const LoadedImages& all,
                 const std::optional<std::string>& range) {
    const LoadedImages images = range ? Within(all, device.RangeInFlash(range)) : all;
    RequireFit(device, device.Info(), images);
    device.Meter().Expect(Phase::Verify, images.image.ByteCount());
    const Differences differences = CompareWithFlash(device, device.Meter(), images.image);
    const bool equal = differences.Empty();
    Outcome outcome{.result = {{"equal", equal}, {"phases", PhasesJson(device.Meter().Phases())}}};
    ShowSummary(context.reporter, device.Meter().Phases());
    if (equal)
        context.reporter.Result("The flash holds the image");
    else
        FailAsDifferent(outcome, differences, images, "");
    return outcome;
}

Outcome RunVerify(Context& context, const VerifyOptions& options) {
    const LoadedImages images = ReadNamed(context, options.files, options);
    return WithDevice(context, [&](FlashDevice& device) {
        return VerifyOn(context, device, images, options.range);
    });
}

}  // namespace

CommandRow Verify() {
    return Command<VerifyOptions>({.name = "verify",
                                   .help = "Compare flash with image files",
                                   .details = "The exit status is 5 when a byte differs.",
                                   .example = "  corvane-flash verify firmware.elf"},
                                  {ImagesArgument(true), FormatOption(), BaseOption(),
                                   RangeOption("Compare only these addresses; default: all of the "
                                               "image")},
                                  RunVerify);
}

}  // namespace host::commands
