// corvane-flash mac: the MAC address that the two user registers hold.

#include <fmt/format.h>

#include "host/base/MacAddress.h"
#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/SharedOptions.h"
#include "host/driver/FlashDevice.h"
#include "host/facts/SettingKeys.h"
#include "host/flashing/UserRegisters.h"

namespace host::commands {

namespace {

struct MacOptions : Committing {
    std::string address;
    bool anyAddress = false;  ///< program one that no device should have
};

/// Read through the plug-in; the host has padded it to two digits a byte.
std::string ReadMac(FlashDevice& device) {
    device.Perform(plugin::kReadMac, Verbosity::Verbose);
    return device.Published(keys::kMacInput);
}

Outcome ShowMac(Context& context, FlashDevice& device) {
    const std::string mac = ReadMac(device);
    context.reporter.Result(mac);
    return {.result = {{"mac", mac}}};
}

Outcome Write(Context& context, FlashDevice& device, const MacAddress& mac, bool commit) {
    const std::string old = ReadMac(device);
    context.settings.Set(Origin::CommandLine, keys::kMacInput, mac.Text());
    ChooseCommit(context.settings, context.reporter, keys::kMacCommit, commit);
    device.Perform(plugin::kProgramMac);
    Outcome outcome;
    const RegisterValues values =
        CheckRegisters(device, {mac.Register(0), mac.Register(1)}, outcome);
    const std::string now = MacAddress::FromRegisters(*values[0], *values[1]).Text();
    context.reporter.Result(fmt::format("MAC address: was {}, is {}", old, now));
    outcome.result.update({{"old", old}, {"mac", now}});
    SayWhetherCommitted(context.reporter, device.UserRegisters(), outcome);
    return outcome;
}

MacAddress RequireMac(const MacOptions& options) {
    const std::string& text = options.address;
    const auto mac = ParseMacAddress(text);
    if (!mac)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("'{}' is no MAC address; write six hexadecimal bytes, as in "
                                  "02-1b-c3-04-05-06, 2:1b:c3:4:5:6 or 021bc3040506",
                                  text));
    const std::string objection = mac->Objection();
    if (!objection.empty() && !options.anyAddress)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{} {}; no device should have it; --any-address programs it "
                                  "all the same",
                                  text, objection));
    return *mac;
}

Outcome RunReadMac(Context& context, const NoOptions& /*options*/) {
    return WithDevice(context, [&](FlashDevice& device) { return ShowMac(context, device); });
}

Outcome RunProgramMac(Context& context, const MacOptions& options) {
    const MacAddress mac = RequireMac(options);
    return WithDevice(
        context, [&](FlashDevice& device) { return Write(context, device, mac, options.commit); });
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
         {&MacOptions::anyAddress,
          {"--any-address", "", "Program a multicast, all-zeros or all-ones address"}}},
        RunProgramMac);
}

}  // namespace host::commands
