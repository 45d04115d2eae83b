// Opening a simulated device, and keeping its contents.

#include "host/targets/SimulatedTarget.h"

#include <fmt/format.h>

#include <filesystem>
#include <system_error>

#include "host/base/Errors.h"
#include "target/simulated/ContentsFile.h"
#include "target/simulated/DeviceOptions.h"

namespace host {

namespace {

std::unique_ptr<target::SimulatedDevice> Open(const TargetOptions& options) {
    const target::DeviceOptions device =
        options.sim ? target::ParseDeviceOptions(*options.sim) : target::DefaultDeviceOptions();
    if (options.simFile) return target::OpenContents(*options.simFile, device);
    return std::make_unique<target::SimulatedDevice>(device);
}

}  // namespace

SimulatedTarget::SimulatedTarget(const TargetOptions& options)
    : path_(options.simFile.value_or("")) {
    try {
        device_ = Open(options);
    } catch (const target::OptionError& error) {
        throw Failure(ExitStatus::WrongUsage, fmt::format("--sim: {}", error.what()));
    } catch (const target::ContentsError& error) {
        throw Failure(ExitStatus::Unreachable, error.what());
    }
}

void SimulatedTarget::Save(bool changed) const try {
    std::error_code ignored;
    if (!path_.empty() && (changed || !std::filesystem::exists(path_, ignored)))
        target::SaveContents(path_, *device_);
} catch (const target::ContentsError& error) {
    throw Failure(ExitStatus::Unreachable, error.what());
}

}  // namespace host
