// corvane-flash reset: resets the device and leaves it halted, or running its program.

#include "host/commands/Commands.h"
#include "host/driver/FlashDevice.h"

namespace host::commands {

namespace {

Outcome Reset(Context& context, FlashDevice& device) {
    if (context.options.run)
        device.StartProgram();
    else
        device.Reset();
    return {.result = {{"running", context.options.run}}};
}

Outcome RunReset(Context& context) {
    return WithDevice(context, [&](FlashDevice& device) { return Reset(context, device); });
}

}  // namespace

CommandRow Reset() {
    return {"reset",
            "Reset the device, and leave it halted or let it run",
            "",
            "  corvane-flash --gdb :3333 reset --run",
            {RunOption("Let the device run its program afterwards")},
            RunReset};
}

}  // namespace host::commands
