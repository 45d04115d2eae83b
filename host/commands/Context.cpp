// From a command's options to an open device, and from that to its contents kept.

#include "host/commands/Context.h"

#include <utility>

namespace host {

namespace {

DeviceOptions DeviceOf(const Options& options) {
    return {{options.sim, options.simFile}, options.plugin, options.trace};
}

}  // namespace

Outcome WithDevice(Context& context, const std::function<Outcome(FlashDevice&)>& work) {
    FlashDevice device(DeviceOf(context.options), context.settings, context.reporter);
    Outcome outcome;
    try {
        outcome = work(device);
    } catch (...) {
        device.LeaveHalted();
        try {
            device.Save();
        } catch (const Failure& second) {
            context.reporter.Error(second.what());
        }
        throw;
    }
    if (!context.options.dryRun) device.Save();
    return outcome;
}

Outcome NothingTouched(Context& context, Json plan) {
    context.reporter.Result("Dry run: nothing was touched");
    plan["dryRun"] = true;
    return {.result = std::move(plan)};
}

image::ReadOptions ImageOptions(const Options& options) {
    image::ReadOptions read;
    if (options.format) read.format = image::FormatFromName(*options.format);
    if (options.base) read.base = ParseHexArgument(*options.base, "--base");
    return read;
}

}  // namespace host
