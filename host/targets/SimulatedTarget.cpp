// Opening a simulated device, and keeping its contents.

#include "host/targets/SimulatedTarget.h"

#include <fmt/format.h>

#include <algorithm>
#include <cerrno>

#include "base/system/Files.h"
#include "host/base/Errors.h"
#include "host/base/Suggestion.h"
#include "host/files/InputFile.h"
#include "host/files/OutputFile.h"
#include "target/simulated/Contents.h"
#include "target/simulated/options/DeviceOptions.h"

namespace host {

namespace {

constexpr FileKind kContentsFile{"contents file of the simulated device", ExitStatus::Unreachable,
                                 target::kContentsBytesMax};

/// The same when it can't be written: then the device was worked on.
constexpr FileKind kKeptContents{kContentsFile.name, ExitStatus::BadFile, kContentsFile.maxBytes};

bool IsThere(const std::string& path) {
    return base::StatusOf(path) || (errno != ENOENT && errno != ENOTDIR);
}

/// The class or option that the first unknown name in an option text probably stands for.
std::string NearestName(const std::string& text) {
    const std::vector<std::string>* known = &target::DeviceClassNames();
    for (std::size_t start = 0; start < text.size();) {
        const std::size_t end = std::min(text.find(',', start), text.size());
        const std::string item = text.substr(start, end - start);
        const std::string name = item.substr(0, item.find('='));
        if (std::find(known->begin(), known->end(), name) == known->end())
            return Suggestion(name, *known);
        known = &target::DeviceOptionNames();
        start = end + 1;
    }
    return {};
}

std::string WithSuggestion(std::string text, const std::string& suggestion) {
    if (!suggestion.empty() && text.ends_with('.')) text.pop_back();
    return text + suggestion;
}

/// A file that is replaced when it is saved would part from its other names.
void RequireOneName(const std::string& path) {
    const auto status = base::StatusOf(path);
    if (status && status->names > 1 && status->type == base::FileType::Regular)
        throw Failure(ExitStatus::BadFile,
                      fmt::format("the {} {} has {} names (hard links), and saving it would leave "
                                  "the others behind; copy it, or use a symbolic link",
                                  kContentsFile.name, path, status->names));
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
    if (!path_.empty()) RequireOneName(path_);
    try {
        device_ = Open(options);
    } catch (const target::OptionError& error) {
        throw Failure(
            ExitStatus::WrongUsage,
            "--sim: " + WithSuggestion(error.what(), NearestName(options.sim.value_or(""))));
    } catch (const target::ContentsError& error) {
        throw Failure(ExitStatus::Unreachable,
                      fmt::format("the {} {} can't be used: {}; name another file, or remove it to "
                                  "start with an erased device",
                                  kContentsFile.name, path_, error.what()));
    }
}

std::string SimulatedTarget::Name() const {
    return fmt::format("Simulated {}, kept {}", device_->Options().className,
                       path_.empty() ? "nowhere" : "in " + path_);
}

std::string SimulatedTarget::Description() const {
    return Name() + (path_.empty() ? "; --gdb for a board" : "");
}

void SimulatedTarget::Keep(bool changed) {
    if (path_.empty() || (!changed && IsThere(path_))) return;
    WriteWholeFile(kKeptContents, path_, target::EncodeContents(*device_), Existing::Replace);
}

void SimulatedTarget::Release(bool run) {
    if (run) device_->Continue();
}

}  // namespace host
