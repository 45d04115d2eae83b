// corvane-flash operation: any of the plug-in's operations by its name, with the settings as they
// are.

#include <fmt/format.h>

#include "host/base/MacAddress.h"
#include "host/commands/Commands.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/RangeOperation.h"
#include "host/settings/SettingKeys.h"

namespace host::commands {

namespace {

/// The default of the address setting is what an unprogrammed device holds; nobody means that.
void RequireMacSetting(const Context& context) {
    const std::string text = context.settings.Text(keys::kMacInput);
    const std::string objection = ParseMacAddress(text).value_or(MacAddress{}).Objection();
    if (objection.empty()) return;
    throw Failure(ExitStatus::WrongUsage,
                  fmt::format("the setting {}, {}, {}; set another one, or use 'corvane-flash mac "
                              "program --force'",
                              keys::kMacInput, text, objection));
}

bool IsListed(const std::string& operations, const std::string& name) {
    const std::string separator = plugin::kOperationSeparator;
    return (separator + operations + separator).find(separator + name + separator) !=
           std::string::npos;
}

Outcome Run(Context& context) {
    const std::string& name = *context.options.argument;
    if (name == plugin::kProgramMac) RequireMacSetting(context);
    return WithDevice(context, [&](FlashDevice& device) {
        try {
            return RunOperation(device, name);
        } catch (const ShownFailure& failure) {
            if (IsListed(device.Info().operations, name)) throw;
            throw ShownFailure(failure.Status(), failure.what(),
                               fmt::format("'{}' is none of the plug-in's operations: {}", name,
                                           device.Info().operations),
                               failure.Result());
        }
    });
}

}  // namespace

CommandRow Operation() {
    return {
        "operation",
        "Run one of the plug-in's operations by its name",
        "It works with the settings as they are. 'corvane-flash info' lists the names.",
        "  corvane-flash operation BlankCheck\n"
        "  corvane-flash --set FlashEraseType='Entire Flash' operation Erase",
        {{"NAME", "", "The operation's exact name", &Options::argument, Offers::Nothing, {}, true}},
        Run};
}

}  // namespace host::commands
