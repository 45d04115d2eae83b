// What a command works with, and how it gets at a device.

#pragma once

#include <functional>
#include <optional>

#include "host/cli/CommonOptions.h"
#include "host/driver/FlashDevice.h"
#include "host/files/FilesInUse.h"
#include "host/files/OutputFile.h"
#include "host/flashing/ImageSet.h"
#include "host/output/Reporter.h"
#include "host/settings/SettingStore.h"

namespace host {

struct Context {
    const CommonOptions& options;
    Reporter& reporter;
    SettingStore& settings;

    /// The image files of the command, as it names them: nothing may be written over them.
    std::vector<std::string> imageFiles = {};

    /// A dry run: neither the simulated device's contents nor settings are kept.
    bool isDryRun = false;
};

/// The target that the options ask for. Failure (WrongUsage) when variables of the environment ask
/// for two.
const TargetOptions& TargetOf(const CommonOptions& options);

/// Runs a command's work on the device. Whatever becomes of it, the simulated device's contents
/// are kept, except after a dry run; whatever it throws, the target is left halted. A real one is
/// released; a trace that isn't whole is a failure.
Outcome WithDevice(Context& context, const std::function<Outcome(FlashDevice&)>& work);

/// Runs work that may be traced. A trace that isn't whole is a failure.
Outcome WithTrace(Context& context, const std::function<Outcome(Trace*)>& work);

/// The trace that the options ask for. Failure (BadFile).
std::optional<Trace> OpenTrace(const Context& context);

/// What ends a dry run: `plan` is what would be done.
Outcome NothingTouched(Context& context, Json plan);

/// What the run reads: standard input and what the command line names.
FilesInUse ReadFiles(const Context& context);

/// The same and the device file: what nothing else may be written over.
FilesInUse InputFiles(const Context& context);

/// --force.
Existing ExistingFiles(const CommonOptions& options);

}  // namespace host
