// corvane-flash blank-check: is the flash, or some of it, erased?

#include <fmt/format.h>

#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/RangeOperation.h"

namespace host::commands {

namespace {

Outcome BlankCheckOn(Context& context, FlashDevice& device, const RangeChoice& options) {
    const ChosenRanges chosen = ChooseJoinedRanges(device, options.ranges);
    Outcome outcome = RunOverRanges(device, plugin::kBlankCheck, chosen, {});
    outcome.result["blank"] = true;
    for (const base::AddressRange& range : chosen.ranges)
        context.reporter.Result(RangeText(range) + " is blank");
    return outcome;
}

Outcome RunBlankCheck(Context& context, const RangeChoice& options) {
    return WithDevice(context,
                      [&](FlashDevice& device) { return BlankCheckOn(context, device, options); });
}

}  // namespace

CommandRow BlankCheck() {
    return Command<RangeChoice>(
        {.name = "blank-check",
         .help = "Check that the flash, or some of it, is erased",
         .details = "The exit status is 5 when a byte isn't 0xFF.",
         .example = "  corvane-flash blank-check --range 0x8000-0x8fff"},
        {RangeOption("The addresses to check; default: the whole flash; may be repeated")},
        RunBlankCheck);
}

}  // namespace host::commands
