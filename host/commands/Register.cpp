// corvane-flash register: the two non-volatile user registers.

#include <fmt/format.h>

#include "base/Hex.h"
#include "host/commands/Commands.h"
#include "host/driver/FlashDevice.h"
#include "host/facts/SettingKeys.h"
#include "host/flashing/UserRegisters.h"

namespace host::commands {

namespace {

unsigned Index(const Context& context) {
    return context.options.index == "1" ? 1 : 0;
}

OptionRow IndexArgument() {
    return {"INDEX", "", "0 or 1", &Options::index, Offers::Nothing, {"0", "1"}, true};
}

Outcome ShowRegister(Context& context, FlashDevice& device) {
    const unsigned index = Index(context);
    const std::uint32_t value = ReadRegister(device, index);
    context.reporter.Result(fmt::format("{:#010x}", value));
    return {.result = {{"register", index}, {"value", value}}};
}

Outcome Write(Context& context, FlashDevice& device, std::uint32_t value) {
    const unsigned index = Index(context);
    const std::uint32_t old = ReadRegister(device, index);
    context.settings.Set(Origin::CommandLine, keys::kRegisterInputs[index], base::HexText(value));
    ChooseCommit(context.settings, context.reporter, keys::kRegisterCommits[index],
                 context.options.commit);
    device.Perform(plugin::ProgramRegisterOperation(index));
    Outcome outcome;
    RegisterValues expected;
    expected.at(index) = value;
    const std::uint32_t now = *CheckRegisters(device, expected, outcome).at(index);
    context.reporter.Result(
        fmt::format("User register {}: was {:#010x}, is {:#010x}", index, old, now));
    outcome.result.update({{"register", index}, {"old", old}, {"value", now}});
    SayWhetherCommitted(context.reporter, device.UserRegisters(), outcome);
    return outcome;
}

Outcome RunReadRegister(Context& context) {
    return WithDevice(context, [&](FlashDevice& device) { return ShowRegister(context, device); });
}

Outcome RunProgramRegister(Context& context) {
    const std::uint32_t value = ParseHexArgument(*context.options.value, "the value");
    return WithDevice(context, [&](FlashDevice& device) { return Write(context, device, value); });
}

}  // namespace

CommandRow RegisterRead() {
    return {"register read",   "Read a user register", "", "  corvane-flash register read 0",
            {IndexArgument()}, RunReadRegister};
}

CommandRow RegisterProgram() {
    return {
        "register program",
        "Program a user register",
        "Without --commit the next reset of the device brings back what was committed last.",
        "  corvane-flash register program 0 0x12ab --commit",
        {IndexArgument(),
         {"VALUE", "", "Hexadecimal, up to 32 bits", &Options::value, Offers::Nothing, {}, true},
         CommitOption()},
        RunProgramRegister};
}

}  // namespace host::commands
