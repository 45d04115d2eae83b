// corvane-flash mac: the MAC address that the two user registers hold.

#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/commands/WrittenRegisters.h"
#include "host/driver/FlashDevice.h"

namespace host::commands {

namespace {

struct MacOptions : Committing, AnyAddress {
    std::string address;
};

Outcome ShowMac(Context& context, FlashDevice& device) {
    const std::string mac = ReadMac(device);
    context.reporter.Result(mac);
    return {.result = {{"mac", mac}}};
}

Outcome RunReadMac(Context& context, const NoOptions& /*options*/) {
    return WithDevice(context, [&](FlashDevice& device) { return ShowMac(context, device); });
}

Outcome RunProgramMac(Context& context, const MacOptions& options) {
    const MacAddress mac = RequireMac(options.address, options);
    return WithDevice(context, [&](FlashDevice& device) {
        return WriteMac(context, device, mac, options.commit);
    });
}

}  // namespace

CommandRow MacRead() {
    return Command<NoOptions>(
        {.name = "mac read", .help = "Read the MAC address", .example = "  corvane-flash mac read"},
        {}, RunReadMac);
}

CommandRow MacProgram() {
    return Command<MacOptions>(
        {.name = "mac program",
         .help = "Program the MAC address",
         .details = "Without --commit the next reset of the device brings back what was committed "
                    "last.",
         .example = "  corvane-flash mac program 02-1b-c3-04-05-06 --commit"},
        {{&MacOptions::address,
          {.names = "ADDRESS",
           .help = "Six hexadecimal bytes, separated by - or : or not at all",
           .isRequired = true}},
         CommitOption(),
         AnyAddressOption()},
        RunProgramMac);
}

}  // namespace host::commands
