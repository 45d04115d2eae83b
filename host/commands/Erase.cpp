// corvane-flash erase: the whole flash or the sectors of a range, never either unasked.

#include <fmt/format.h>

#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/DeviceGeometry.h"
#include "host/flashing/RangeOperation.h"

namespace host::commands {

namespace {

struct EraseOptions : RangeChoice, Comparing, DryRun {
    bool all = false;
};

Outcome EraseOn(Context& context, FlashDevice& device, const EraseOptions& options) {
    const base::AddressRange range = ChooseRange(device, kEraseKeys, options.range);
    if (options.all) RequireWholeErase(device.Info(), "--range");
    const FlashGeometry flash = GeometryOf(device.Info());
    const base::AddressRange covered = SectorsCovering(range, flash);
    const std::uint64_t sectors = SectorCount(covered, flash);
    Json members{{"address", covered.first}, {"bytes", covered.Size()}, {"sectors", sectors}};
    if (options.dryRun) {
        context.reporter.Result(
            fmt::format("would erase {}: {}, {}; {} of flash are left as they are",
                        RangeText(covered), CountText(sectors, "sector"), SizeText(covered.Size()),
                        SizeText(flash.flashBytes - covered.Size())));
        return NothingTouched(context, members);
    }
    device.AddToFailures(members);
    const bool verify = !options.noVerify;
    Outcome outcome = RunOperation(device, plugin::kErase, Verbosity::Verbose, verify);
    outcome.result.update(members);
    if (outcome.status == ExitStatus::Done)
        context.reporter.Done(verify ? fmt::format("Done: {} is blank", RangeText(covered))
                                     : "Done: the device reported the erase done, and nothing was "
                                       "compared");
    return outcome;
}

Outcome RunErase(Context& context, const EraseOptions& options) {
    context.isDryRun = options.dryRun;
    if (options.all == options.range.has_value())
        throw Failure(ExitStatus::WrongUsage,
                      options.all
                          ? "erase takes --all or --range A-B, not both"
                          : "erase what? --all for the whole flash, or --range A-B for the sectors "
                            "that hold these addresses");
    return WithDevice(context,
                      [&](FlashDevice& device) { return EraseOn(context, device, options); });
}

}  // namespace

CommandRow Erase() {
    return Command<EraseOptions>(
        {.name = "erase",
         .help = "Erase the whole flash, or the sectors of a range",
         .details = "A sector is erased whole: what it holds outside of the range is lost as well.",
         .example = "  corvane-flash erase --range 0x8000-0x8fff\n"
                    "  corvane-flash erase --all --dry-run"},
        {{&EraseOptions::all, {"--all", "", "Erase the whole flash"}},
         RangeOption("Erase the sectors that hold these addresses"),
         NoVerifyOption(),
         DryRunOption()},
        RunErase);
}

}  // namespace host::commands
