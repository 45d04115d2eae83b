// See UserRegisters.h.

#include "host/commands/UserRegisters.h"

#include <fmt/format.h>

#include "host/FlashDevice.h"

namespace host {

std::uint32_t ReadRegister(Context& context, FlashDevice& device, unsigned index) {
    device.Perform(fmt::format("ReadUserRegister{}", index), Talk::Verbose);
    const std::string key = fmt::format("FlashUserRegister{}Input", index);
    return ParseHexArgument(context.settings.Kept(key), "what the plug-in has read");
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

void SayWhetherCommitted(Context& context) {
    context.reporter.Say(
        Talk::Normal, context.options.commit
                          ? "Committed: the value stays after a reset."
                          : "Not committed: the value is gone after the next reset of the device "
                            "(a simulated one is reset after each run); --commit keeps it.");
}

}  // namespace host
