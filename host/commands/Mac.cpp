// corvane-flash mac: the MAC address that the two user registers hold.

#include <fmt/format.h>

#include "host/base/MacAddress.h"
#include "host/commands/Commands.h"
#include "host/driver/FlashDevice.h"
#include "host/facts/SettingKeys.h"
#include "host/flashing/UserRegisters.h"

namespace host::commands {

namespace {

/// Read through the plug-in; the host has padded it to two digits a byte.
std::string ReadMac(FlashDevice& device) {
    device.Perform(plugin::kReadMac, Talk::Verbose);
    return device.Published(keys::kMacInput);
}

Outcome ShowMac(Context& context, FlashDevice& device) {
    const std::string mac = ReadMac(device);
    context.reporter.Result(mac);
    return {.result = {{"mac", mac}}};
}

Outcome Write(Context& context, FlashDevice& device, const MacAddress& mac) {
    const std::string old = ReadMac(device);
    context.settings.Set(Origin::CommandLine, keys::kMacInput, mac.Text());
    ChooseCommit(context.settings, context.reporter, keys::kMacCommit, context.options.commit);
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

MacAddress RequireMac(const Options& options) {
    const std::string& text = *options.argument;
    const auto mac = ParseMacAddress(text);
    if (!mac)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("'{}' is no MAC address; write six hexadecimal bytes, as in "
                                  "02-1b-c3-04-05-06, 2:1b:c3:4:5:6 or 021bc3040506",
                                  text));
    const std::string objection = mac->Objection();
    if (!objection.empty() && !options.force)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{} {}; no device should have it; --force programs it all the "
                                  "same",
                                  text, objection));
    return *mac;
}

Outcome RunReadMac(Context& context) {
    return WithDevice(context, [&](FlashDevice& device) { return ShowMac(context, device); });
}

Outcome RunProgramMac(Context& context) {
    const MacAddress mac = RequireMac(context.options);
    return WithDevice(context, [&](FlashDevice& device) { return Write(context, device, mac); });
}

}  // namespace

CommandRow MacRead() {
    return {"mac read", "Read the MAC address", "", "  corvane-flash mac read", {}, RunReadMac};
}

CommandRow MacProgram() {
    return {
        "mac program",
        "Program the MAC address",
        "Without --commit the next reset of the device brings back what was committed last.",
        "  corvane-flash mac program 02-1b-c3-04-05-06 --commit",
        {{"ADDRESS",
          "",
          "Six hexadecimal bytes, separated by - or : or not at all",
          &Options::argument,
          Offers::Nothing,
          {},
          true},
         CommitOption(),
         {"--force", "", "Program a multicast, all-zeros or all-ones address", &Options::force}},
        RunProgramMac};
}

}  // namespace host::commands
