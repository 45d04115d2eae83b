// corvane-flash info: what the plug-in has found out about the device.

#include <fmt/format.h>

#include "base/system/Terminal.h"
#include "host/cli/Layout.h"
#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/commands/FileInfo.h"
#include "host/driver/FlashDevice.h"

namespace host::commands {

namespace {

/// Wrapped behind the names where people read it; a line for programs.
std::string OnThisScreen(const std::string& operations) {
    constexpr std::size_t kNameColumns = 12;
    if (!base::IsTerminal(stdout)) return operations;
    std::string text = Wrap(operations, kNameColumns + 1, kNameColumns).substr(1);
    text.pop_back();
    return text;
}

Outcome ShowInfo(Context& context, FlashDevice& device) {
    const DeviceInfo& info = device.Info();
    Reporter& reporter = context.reporter;
    const std::string flash =
        info.hasFlash ? fmt::format("{} ({})", SizeText(info.flashBytes), RangeText(info.Flash()))
                      : "none that the plug-in can work on";
    reporter.Result("Family      " + (info.family.empty() ? "not recognized" : info.family));
    reporter.Result(fmt::format("Id register {:#010x}", info.identification));
    reporter.Result("Flash       " + flash);
    reporter.Result("Sector      " + SizeText(info.sectorBytes));
    reporter.Result("RAM         " + SizeText(info.ramBytes));
    reporter.Document("Operations  " + OnThisScreen(info.operations));
    reporter.Result("Plug-in     " + device.LibraryPath());
    return {.result = {{"family", info.family},
                       {"identification", info.identification},
                       {"hasFlash", info.hasFlash},
                       {"flashBytes", info.flashBytes},
                       {"sectorBytes", info.sectorBytes},
                       {"ramBytes", info.ramBytes},
                       {"operations", plugin::OperationNames(info.operations)},
                       {"plugin", device.LibraryPath()},
                       {"target", ToJson(static_cast<const TargetOptions&>(context.options))}}};
}

Outcome RunInfo(Context& context, const ImageFiles& options) {
    if (!options.files.empty()) return ShowFiles(context, options);
    if (options.format || options.base)
        throw Failure(ExitStatus::WrongUsage,
                      "--format and --base say how a FILE is read; name one, or leave them out");
    return WithDevice(context, [&](FlashDevice& device) { return ShowInfo(context, device); });
}

}  // namespace

CommandRow Info() {
    return Command<ImageFiles>(
        {.name = "info",
         .help = "Show the device: family, id, flash, sectors, RAM, operations",
         .details = "With a FILE, no device is asked: what the file holds is shown, and which "
                    "classes of device have enough flash for it. Without one, a board "
                    "is left halted: 'corvane-flash reset --run' starts its program.",
         .example = "  corvane-flash --sim quen,flash=512K info\n"
                    "  corvane-flash info firmware.elf"},
        {ImagesArgument(false), FormatOption(), BaseOption()}, RunInfo);
}

}  // namespace host::commands
