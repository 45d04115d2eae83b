// corvane-flash register: the two non-volatile user registers.

#include <fmt/format.h>

#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/commands/WrittenRegisters.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/UserRegisters.h"

namespace host::commands {

namespace {

struct RegisterOptions {
    std::string index;

    unsigned Index() const { return index == "1" ? 1 : 0; }
};

struct RegisterProgramOptions : RegisterOptions, Committing {
    std::string value;
};

Option<RegisterOptions> IndexArgument() {
    return {&RegisterOptions::index,
            {.names = "INDEX", .help = "0 or 1", .choices = {"0", "1"}, .isRequired = true}};
}

Outcome ShowRegister(Context& context, FlashDevice& device, unsigned index) {
    const std::uint32_t value = ReadRegister(device, index);
    context.reporter.Result(fmt::format("{:#010x}", value));
    return {.result = {{"register", index}, {"value", value}}};
}

Outcome RunReadRegister(Context& context, const RegisterOptions& options) {
    return WithDevice(context, [&](FlashDevice& device) {
        return ShowRegister(context, device, options.Index());
    });
}

Outcome RunProgramRegister(Context& context, const RegisterProgramOptions& options) {
    const std::uint32_t value = ParseHexArgument(options.value, "the value");
    return WithDevice(context, [&](FlashDevice& device) {
        return WriteRegister(context, device, options.Index(), value, options.commit);
    });
}

}  // namespace

CommandRow RegisterRead() {
    return Command<RegisterOptions>({.name = "register read",
                                     .help = "Read a user register",
                                     .example = "  corvane-flash register read 0"},
                                    {IndexArgument()}, RunReadRegister);
}

CommandRow RegisterProgram() {
    return Command<RegisterProgramOptions>(
        {.name = "register program",
         .help = "Program a user register",
         .details = "Without --commit the next reset of the device brings back what was committed "
                    "last.",
         .example = "  corvane-flash register program 0 0x12ab --commit"},
        {IndexArgument(),
         {&RegisterProgramOptions::value,
          {.names = "VALUE", .help = "Hexadecimal, up to 32 bits", .isRequired = true}},
         CommitOption()},
        RunProgramRegister);
}

}  // namespace host::commands
