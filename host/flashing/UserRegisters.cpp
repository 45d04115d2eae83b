// Reading a user register, and judging what it holds after it was programmed.

#include "host/flashing/UserRegisters.h"

#include <fmt/format.h>

#include "host/base/PluginFacts.h"
#include "host/driver/FlashDevice.h"
#include "host/settings/SettingKeys.h"

namespace host {

std::uint32_t ReadRegister(FlashDevice& device, unsigned index) {
    device.Perform(plugin::ReadRegisterOperation(index), Talk::Verbose);
    return ParseHexArgument(device.Settings().Kept(keys::kRegisterInputs[index]),
                            "what the plug-in has read");
}

void RequireRegister(Outcome& outcome, unsigned index, std::uint32_t expected,
                     std::uint32_t actual) {
    if (expected == actual) return;
    outcome.status = ExitStatus::ContentsDiffer;
    outcome.error = fmt::format(
        "user register {} reads {:#010x} after {:#010x} was programmed; a committed register may "
        "not take another value",
        index, actual, expected);
}

void SayWhetherCommitted(Reporter& reporter, bool committed) {
    reporter.Say(Talk::Normal,
                 committed ? "Committed: the value stays after a reset."
                           : "Not committed: the value is gone after the next reset of the device "
                             "(a simulated one is reset after each run); --commit keeps it.");
}

}  // namespace host
