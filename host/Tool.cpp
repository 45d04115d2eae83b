// One run of the tool: words parsed, settings loaded, the command run, every failure shown.

#include "host/Tool.h"

#include <fmt/format.h>

#include <algorithm>
#include <cerrno>
#include <exception>
#include <optional>

#include "base/system/ErrorText.h"
#include "base/system/StandardStreams.h"
#include "host/base/Interrupt.h"
#include "host/cli/CommandLine.h"
#include "host/commands/Commands.h"
#include "host/facts/SettingKeys.h"
#include "host/files/FileLock.h"
#include "host/files/Streams.h"

namespace host {

namespace {

Reporter::Options ReporterOptions(const CommonOptions& options) {
    const int level = options.quiet ? 0 : std::min(options.verbose, 2) + 1;
    // A trace on the same stream and a bar would spoil each other.
    const bool traced = options.trace == "-" && options.progress == "auto";
    return {static_cast<Verbosity>(level), options.json, traced ? "none" : options.progress};
}

/// What was published on the way is worth keeping after a failure as well; that it can't be kept
/// (there may be no home directory) is no reason for a command to fail. That another run keeps us
/// from it is one.
std::optional<FileBusy> SaveSettings(const Context& context) try {
    if (!context.isDryRun)
        context.settings.Save(
            [&](const std::string& text) { context.reporter.Say(Verbosity::Normal, text); });
    return std::nullopt;
} catch (const FileBusy& busy) {
    return busy;
} catch (const Failure& failure) {
    context.reporter.Say(Verbosity::Verbose, failure.what());
    return std::nullopt;
}

Outcome RunCommand(Reporter& reporter, const ParsedLine& line) {
    SettingStore settings;
    const CommonOptions& options = line.common;
    if (line.command->needs != Needs::Nothing)
        settings = LoadSettings(options.settingsFile.value_or(""), options.set, line.project);
    if (options.verbose >= 2) settings.SetUnlessChosen(keys::kVerbose, "1");
    Context context{options, reporter, settings};
    Outcome outcome;
    try {
        outcome = line.command->run(context, line.given);
    } catch (const FileBusy&) {
        throw;  // it has been waited for; nobody wants to wait once more
    } catch (...) {
        if (const auto busy = SaveSettings(context)) reporter.Error(busy->what());
        throw;
    }
    const auto busy = SaveSettings(context);
    if (!busy || outcome.status != ExitStatus::Done) return outcome;
    return {busy->Status(), busy->what(), outcome.result};
}

/// Runs something and shows how it failed, if it did.
template <typename Action>
Outcome Guarded(Reporter& reporter, Action&& action) try {
    Outcome outcome = action();
    if (!outcome.error.empty()) reporter.ClosingError(outcome.error);
    for (const std::string& line : outcome.details)
        reporter.ErrorDetail(line);
    return outcome;
} catch (const DeviceFailure& failure) {
    reporter.ClosingError(failure.Remark());
    return {failure.Status(), failure.what(), failure.Result()};
} catch (const Failure& failure) {
    reporter.ClosingError(failure.what());
    return {failure.Status(), failure.what()};
} catch (const std::exception& error) {
    const std::string text =
        fmt::format("an error of corvane-flash itself: {}; please report it", error.what());
    reporter.ClosingError(text);
    return {ExitStatus::InternalError, text};
}

/// Results that nobody could receive are no success; a reader that has had enough is.
Outcome CheckOutput(Outcome outcome, int error, Reporter& reporter) {
    if (error == 0 || error == EPIPE || outcome.status != ExitStatus::Done) return outcome;
    const std::string text = "can't write to standard output: " + base::ErrorText(error);
    reporter.ClosingError(text);
    const auto status = Interrupted() ? ExitStatus::Interrupted : ExitStatus::BadFile;
    return {status, text, outcome.result};
}

}  // namespace

int RunTool(const std::vector<std::string>& words) {
    // Whoever asked for JSON gets the end line of a command line that can't be read, too.
    const FollowedLine followed = FollowLine(AllCommands(), words);
    ParsedLine line;
    Reporter early({Verbosity::Normal, followed.Has("--json"), "none"});
    Outcome outcome = Guarded(early, [&] {
        line = ParseCommandLine(AllCommands(), followed);
        return Outcome{};
    });
    if (line.command == nullptr) {
        outcome = CheckOutput(outcome, WriteAll(base::kStandardOutput, line.answer), early);
        if (outcome.status != ExitStatus::Done) early.End(outcome);
        return static_cast<int>(outcome.status);
    }
    Reporter reporter(ReporterOptions(line.common));
    const bool hasTarget = line.command->needs >= Needs::ServedTarget;
    reporter.Begin(line.command->name, hasTarget ? ToJson(line.common) : Json(nullptr));
    outcome = Guarded(reporter, [&] { return RunCommand(reporter, line); });
    if (outcome.status == ExitStatus::Done && !outcome.done.empty()) reporter.Done(outcome.done);
    outcome = CheckOutput(std::move(outcome), reporter.OutputError(), reporter);
    reporter.End(outcome);
    return static_cast<int>(outcome.status);
}

}  // namespace host
