// corvane-flash operation: any of the plug-in's operations by its name, with the settings as they
// are.

#include <fmt/format.h>

#include <algorithm>
#include <string>
#include <vector>

#include "host/base/MacAddress.h"
#include "host/base/Suggestion.h"
#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/driver/FlashDevice.h"
#include "host/facts/SettingKeys.h"
#include "host/flashing/ImageChecksum.h"
#include "host/flashing/RangeOperation.h"
#include "host/flashing/UserRegisters.h"

namespace host::commands {

namespace {

struct OperationOptions {
    std::string name;
};

/// A register value to program must have been named; no default is meant for a board.
void RequireRegisterSetting(const Context& context, unsigned index) {
    const char* key = keys::kRegisterInputs[index];
    if (context.settings.Get(key).origin != Origin::Default) return;
    throw Failure(ExitStatus::WrongUsage,
                  fmt::format("nothing says what to program; set {0} with --set, or use "
                              "'corvane-flash register program {1} VALUE'",
                              key, index));
}

/// The default of the address setting is what an unprogrammed device holds; nobody means that.
void RequireMacSetting(const Context& context) {
    const std::string text = context.settings.Text(keys::kMacInput);
    const std::string objection = ParseMacAddress(text).value_or(MacAddress{}).Objection();
    if (objection.empty()) return;
    throw Failure(ExitStatus::WrongUsage,
                  fmt::format("the setting {}, {}, {}; set another one, or use 'corvane-flash mac "
                              "program --any-address'",
                              keys::kMacInput, text, objection));
}

void RequireInput(const Context& context, const std::string& name) {
    if (name == plugin::kProgramMac) RequireMacSetting(context);
    for (const unsigned index : {0U, 1U})
        if (name == plugin::ProgramRegisterOperation(index)) RequireRegisterSetting(context, index);
}

/// What the operation was run for, under the names that the command for it has.
Json Found(const FlashDevice& device, const std::string& name) {
    if (name == plugin::kReadMac) return {{"mac", device.Published(keys::kMacInput)}};
    if (name == plugin::kCalculateChecksum)
        return {{"checksum", ChecksumText(device.Published(keys::kChecksumValue))}};
    for (const unsigned index : {0U, 1U})
        if (name == plugin::ReadRegisterOperation(index))
            return {{"register", index}, {"value", PublishedRegister(device, index)}};
    return Json::object();
}

Outcome OperationOn(FlashDevice& device, const std::string& name) {
    Outcome outcome = RunOperation(device, name, Verbosity::Normal);
    outcome.result.update(Found(device, name));
    const auto& registers = device.UserRegisters().registers;
    const RegisterValues written{registers[0].written, registers[1].written};
    if (written[0] || written[1]) {
        const RegisterValues values = CheckRegisters(device, written, outcome);
        device.Output().Result(Describe(device.UserRegisters(), values));
    }
    if (outcome.status == ExitStatus::Done) outcome.done = fmt::format("Done: operation {}", name);
    return outcome;
}

Outcome RunNamed(Context& context, const OperationOptions& options) {
    const std::string& name = options.name;
    RequireInput(context, name);
    return WithDevice(context, [&](FlashDevice& device) {
        try {
            return OperationOn(device, name);
        } catch (const DeviceFailure& failure) {
            const std::vector<std::string> names = plugin::OperationNames(device.Info().operations);
            if (std::find(names.begin(), names.end(), name) != names.end()) throw;
            const std::string text =
                fmt::format("'{}' is none of the plug-in's operations: {}{}", name,
                            device.Info().operations, Suggestion(name, names));
            throw DeviceFailure(ExitStatus::WrongUsage, text, text, failure.Result());
        }
    });
}

}  // namespace

CommandRow Operation() {
    return Command<OperationOptions>(
        {.name = "operation",
         .help = "Run one of the plug-in's operations by its name",
         .details = "It works with the settings as they are. 'corvane-flash info' lists the names.",
         .example = "  corvane-flash operation BlankCheck\n"
                    "  corvane-flash --set FlashEraseType='Entire Flash' operation Erase"},
        {{&OperationOptions::name,
          {.names = "NAME",
           .help = "The operation's exact name",
           .offers = Offers::SomeChoices,
           .choices = {std::begin(plugin::kOperations), std::end(plugin::kOperations)},
           .isRequired = true}}},
        RunNamed);
}

}  // namespace host::commands
