// From a command's options to an open device, and from that to its contents kept.

#include "host/commands/Context.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <chrono>
#include <filesystem>
#include <string_view>
#include <thread>
#include <utility>

#include "base/Duration.h"
#include "base/system/Environment.h"
#include "base/system/Paths.h"
#include "host/base/Interrupt.h"
#include "host/targets/ExpectedDevice.h"

namespace host {

namespace fs = std::filesystem;

// A typed option silences the variables of the other kind of target. So two kinds can only come
// from two variables, or from two typed options, which are refused where the target is opened.
const TargetOptions& TargetOf(const CommonOptions& options) {
    if (options.gdb && (options.sim || options.simFile) && !options.targetVariables.empty())
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("the environment names a simulated target and a real one, with "
                                  "{}; unset one of them, or say --sim or --gdb",
                                  fmt::join(options.targetVariables, " and ")));
    return options;
}

namespace {

/// How often a board is tried that doesn't answer yet.
constexpr std::chrono::milliseconds kTryAgain{250};

std::chrono::nanoseconds WaitTime(const TargetOptions& options) {
    if (!options.wait) return std::chrono::nanoseconds(0);
    if (const auto time = base::ParseDuration(*options.wait)) return *time;
    throw Failure(ExitStatus::WrongUsage,
                  fmt::format("--wait takes a time of up to an hour as in 500ms or 30s, not '{}'",
                              *options.wait));
}

/// Opens the device that the options name, which may be a board that isn't there yet.
void OpenDevice(Context& context, Trace* trace, std::optional<FlashDevice>& device) {
    const CommonOptions& options = context.options;
    const DeviceOptions named{TargetOf(options), options.plugin, trace};
    const auto end = std::chrono::steady_clock::now() + WaitTime(options);
    if (options.wait) PluginLibrary(options.plugin.value_or(""));  // no wait brings a missing one
    for (std::string told;;) {
        try {
            device.emplace(named, context.settings, context.reporter);
            return;
        } catch (const Failure& failure) {
            const bool isOver = std::chrono::steady_clock::now() >= end;
            if (failure.Status() != ExitStatus::Unreachable || isOver) throw;
            if (told != failure.what())
                context.reporter.Say(Verbosity::Normal,
                                     fmt::format("Waiting for the board: {}", failure.what()));
            told = failure.what();
        }
        std::this_thread::sleep_for(kTryAgain);
        ThrowIfInterrupted();
    }
}

Outcome WorkOn(Context& context, Trace* trace, const std::function<Outcome(FlashDevice&)>& work) {
    std::optional<ExpectedDevice> expected;
    if (context.options.expect) expected = ParseExpectedDevice(*context.options.expect);
    std::optional<FlashDevice> opened;
    OpenDevice(context, trace, opened);
    FlashDevice& device = *opened;
    Outcome outcome;
    try {
        if (expected) RequireExpected(*expected, device.Info().family, device.Info().flashBytes);
        outcome = work(device);
    } catch (...) {
        device.LeaveHalted();
        try {
            device.Close(context.isDryRun ? DeviceFile::LeaveAlone : DeviceFile::Save);
        } catch (const Failure& second) {
            context.reporter.Error(second.what());
        }
        throw;
    }
    try {
        device.Close(context.isDryRun ? DeviceFile::LeaveAlone : DeviceFile::Save);
    } catch (const Failure& failure) {
        if (outcome.status == ExitStatus::Done)
            return {failure.Status(), failure.what(), outcome.result};
        context.reporter.Error(failure.what());
    }
    return outcome;
}

/// The logger of the plug-in appends to whatever file its variable names.
void RequireOtherLog(const Context& context) {
    const auto log = base::EnvironmentVariable("OSTREL_LOG");
    if (log && *log != "stderr") InputFiles(context).RequireOther(*log, "the log (OSTREL_LOG)");
}

void RequireOtherDeviceFile(const Context& context) {
    const std::string file = context.options.simFile.value_or("");
    if (!file.empty() && !context.isDryRun)
        ReadFiles(context).RequireOther(base::NameOf(fs::absolute(base::PathOf(file))),
                                        "the device");
}

}  // namespace

std::optional<Trace> OpenTrace(const Context& context) {
    if (!context.options.trace) return std::nullopt;
    InputFiles(context).RequireOther(*context.options.trace, "the trace");
    return std::optional<Trace>(std::in_place, *context.options.trace,
                                ExistingFiles(context.options));
}

Outcome WithDevice(Context& context, const std::function<Outcome(FlashDevice&)>& work) {
    return WithTrace(context, [&](Trace* trace) { return WorkOn(context, trace, work); });
}

Outcome WithTrace(Context& context, const std::function<Outcome(Trace*)>& work) {
    RequireOtherLog(context);
    RequireOtherDeviceFile(context);
    std::optional<Trace> trace = OpenTrace(context);
    if (!trace) return work(nullptr);
    Outcome outcome;
    try {
        outcome = work(&*trace);
    } catch (...) {
        if (!trace->Problem().empty()) context.reporter.Error(trace->Problem());
        throw;
    }
    if (trace->Problem().empty()) return outcome;
    if (outcome.status != ExitStatus::Done) {
        context.reporter.Error(trace->Problem());
        return outcome;
    }
    return {ExitStatus::BadFile, trace->Problem(), outcome.result};
}

Outcome NothingTouched(Context& context, Json plan) {
    context.reporter.Result(context.options.gdb
                                ? "Dry run: nothing was changed; the board is left halted"
                                : "Dry run: nothing was touched");
    plan["dryRun"] = true;
    return {.result = std::move(plan)};
}

FilesInUse ReadFiles(const Context& context) {
    const CommonOptions& options = context.options;
    FilesInUse files;
    files.AddStandardInput();
    for (const std::string& file : context.imageFiles)
        if (file != "-") files.Add(SplitAddress(file).path, "an image file");
    files.Add(options.loader.value_or(""), "the loader");
    files.Add(context.settings.Paths().user, "the settings file");
    files.AddLocked(context.settings.Paths().kept, "the file of kept settings");
    files.Add(PluginFile(options.plugin.value_or("")), "the plug-in");
    return files;
}

FilesInUse InputFiles(const Context& context) {
    FilesInUse files = ReadFiles(context);
    files.AddLocked(context.options.simFile.value_or(""), "the device file");
    return files;
}

Existing ExistingFiles(const CommonOptions& options) {
    return options.force ? Existing::Replace : Existing::Keep;
}

}  // namespace host
