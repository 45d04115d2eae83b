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

/// The sectors that hold a byte of one of the ranges.
base::AddressSet SectorsOf(const ChosenRanges& chosen, const FlashGeometry& flash) {
    base::AddressSet sectors;
    for (const base::AddressRange& range : chosen.ranges)
        sectors.Add(SectorsCovering(range, flash));
    return sectors;
}

void ShowErase(Reporter& reporter, const base::AddressSet& covered, const FlashGeometry& flash,
               std::uint64_t sectors) {
    reporter.Result(fmt::format("would erase {}: {}, {}; {} of flash are left as they are",
                                RangesText(covered.Ranges()), CountText(sectors, "sector"),
                                SizeText(covered.Bytes()),
                                SizeText(flash.flashBytes - covered.Bytes())));
}

std::string DoneText(const base::AddressSet& covered, bool verified) {
    if (!verified) return "Done: the device reported the erase done, and nothing was compared";
    return fmt::format("Done: {} {} blank", RangesText(covered.Ranges()),
                       covered.Ranges().size() == 1 ? "is" : "are");
}

Outcome EraseOn(Context& context, FlashDevice& device, const EraseOptions& options) {
    ChosenRanges chosen = ChooseJoinedRanges(device, options.ranges);
    if (options.all) RequireWholeErase(device.Info(), "--range");
    const FlashGeometry flash = GeometryOf(device.Info());
    const base::AddressSet covered = SectorsOf(chosen, flash);
    // Two ranges may lie in one sector.
    if (chosen.ranges.size() > 1) chosen.ranges = covered.Ranges();
    std::uint64_t sectors = 0;
    for (const base::AddressRange& run : covered.Ranges())
        sectors += SectorCount(run, flash);
    Json members{{"address", covered.Ranges().front().first},
                 {"bytes", covered.Bytes()},
                 {"sectors", sectors},
                 {"ranges", ToJson(covered.Ranges())}};
    if (options.dryRun) {
        ShowErase(context.reporter, covered, flash, sectors);
        return NothingTouched(context, members);
    }
    device.AddToFailures(members);
    const bool verify = !options.noVerify;
    Outcome outcome = RunOverRanges(device, plugin::kErase, chosen, {.verifyErase = verify});
    outcome.result.update(members);
    if (outcome.status == ExitStatus::Done) outcome.done = DoneText(covered, verify);
    return outcome;
}

Outcome RunErase(Context& context, const EraseOptions& options) {
    context.isDryRun = options.dryRun;
    if (options.all != options.ranges.empty())
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
         .help = "Erase the whole flash, or the sectors of ranges",
         .details = "A sector is erased whole: what it holds outside of the range is lost as well.",
         .example = "  corvane-flash erase --range 0x8000-0x8fff\n"
                    "  corvane-flash erase --all --dry-run"},
        {{&EraseOptions::all, {"--all", "", "Erase the whole flash"}},
         RangeOption("Erase the sectors that hold these addresses; may be repeated"),
         NoVerifyOption(),
         DryRunOption()},
        RunErase);
}

}  // namespace host::commands
