// corvane-flash reset: resets the device and leaves it halted, or running its program.

#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/driver/FlashDevice.h"

namespace host::commands {

namespace {

Outcome ResetDevice(FlashDevice& device, bool run) {
    if (run)
        device.StartProgram();
    else
        device.Reset();
    return {.result = {{"running", run}}};
}

Outcome RunReset(Context& context, const Running& options) {
    return WithDevice(context,
                      [&](FlashDevice& device) { return ResetDevice(device, options.run); });
}

}  // namespace

CommandRow Reset() {
    return Command<Running>({.name = "reset",
                             .help = "Reset the device, and leave it halted or let it run",
                             .example = "  corvane-flash --gdb :3333 reset --run"},
                            {RunOption("Let the device run its program afterwards")}, RunReset);
}

}  // namespace host::commands
