// Reading the user registers, and judging what they hold after they were programmed.

#include "host/flashing/UserRegisters.h"

#include <fmt/format.h>

#include <algorithm>

#include "host/driver/FlashDevice.h"
#include "host/facts/Operations.h"
#include "host/facts/SettingKeys.h"

namespace host {

std::uint32_t ReadRegister(FlashDevice& device, unsigned index) {
    device.Perform(plugin::ReadRegisterOperation(index), Verbosity::Verbose);
    return PublishedRegister(device, index);
}

std::uint32_t PublishedRegister(const FlashDevice& device, unsigned index) {
    return ParseHexArgument(device.Published(keys::kRegisterInputs[index]),
                            "what the plug-in has read");
}

void ChooseCommit(SettingStore& settings, Reporter& reporter, const char* key, bool asked) {
    if (asked) return settings.Set(Origin::CommandLine, key, "1");
    const auto [text, origin] = settings.Get(key);
    if (origin == Origin::Default) return;
    reporter.Say(Verbosity::Normal,
                 fmt::format("{} is {} ({})", key, text, OriginText(origin, settings.Paths())));
}

RegisterValues CheckRegisters(FlashDevice& device, const RegisterValues& expected,
                              Outcome& outcome) {
    RegisterValues values;
    for (unsigned index = 0; index < values.size(); ++index) {
        values[index] = device.ReadUserRegister(index);
        if (!expected[index] || expected[index] == values[index]) continue;
        outcome.status = ExitStatus::ContentsDiffer;
        outcome.error = fmt::format(
            "user register {} reads {:#010x} after {:#010x} was programmed; a committed register "
            "may not take another value",
            index, *values[index], *expected[index]);
    }
    outcome.result["registers"] = ToJson(device.UserRegisters(), values);
    return values;
}

void SayWhetherCommitted(Reporter& reporter, const UserRegisterWork& work, Outcome& outcome) {
    const bool committed = std::ranges::all_of(work.registers, [](const UserRegister& one) {
        return !one.written || one.commit == Commit::Done;
    });
    outcome.result["committed"] = committed;
    if (outcome.status != ExitStatus::Done) return;
    reporter.Say(Verbosity::Normal,
                 committed ? "Committed: the value stays after a reset."
                           : "Not committed: the next reset of the device (a simulated one is "
                             "reset after each run) brings back what was committed last; "
                             "--commit keeps the value.");
}

}  // namespace host
