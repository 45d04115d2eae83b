// Opening a simulated device, and keeping its contents.

#include "host/targets/SimulatedTarget.h"

#include <fmt/format.h>

#include <filesystem>
#include <system_error>

#include "host/base/Errors.h"
#include "host/base/InputFile.h"
#include "host/base/OutputFile.h"
#include "target/simulated/Contents.h"
#include "target/simulated/DeviceOptions.h"

namespace host {

namespace {

constexpr FileKind kContentsFile{"contents file of the simulated device", ExitStatus::Unreachable,
                                 target::kContentsBytesMax};

bool IsThere(const std::string& path) {
    std::error_code error;
    return std::filesystem::exists(path, error) || error;
}

std::unique_ptr<target::SimulatedDevice> Open(const TargetOptions& options) {
    const target::DeviceOptions device =
        options.sim ? target::ParseDeviceOptions(*options.sim) : target::DefaultDeviceOptions();
    if (options.simFile && IsThere(*options.simFile))
        return target::DecodeContents(ReadWholeFile(kContentsFile, *options.simFile), device);
    return std::make_unique<target::SimulatedDevice>(device);
}

}  // namespace

SimulatedTarget::SimulatedTarget(const TargetOptions& options, const WaitNotice& say)
    : path_(options.simFile.value_or("")) {
    if (!path_.empty()) lock_.emplace(kContentsFile, path_, say);
    try {
        device_ = Open(options);
    } catch (const target::OptionError& error) {
        throw Failure(ExitStatus::WrongUsage, fmt::format("--sim: {}", error.what()));
    } catch (const target::ContentsError& error) {
        throw Failure(ExitStatus::Unreachable,
                      fmt::format("the {} {} can't be used: {}; name another file, or remove it to "
                                  "start with an erased device",
                                  kContentsFile.name, path_, error.what()));
    }
}

void SimulatedTarget::Keep(bool changed) {
    if (path_.empty() || (!changed && IsThere(path_))) return;
    WriteWholeFile(kContentsFile, path_, target::EncodeContents(*device_), Existing::Replace);
}

void SimulatedTarget::Release(bool run) {
    if (run) device_->Continue();
}

}  // namespace host
