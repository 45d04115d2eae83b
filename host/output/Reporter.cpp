// The JSON lines are described in docs/command-line-json.md.

#include "host/output/Reporter.h"

#include <fmt/format.h>

#include <cstdio>
#include <string_view>
#include <utility>

#include "base/system/Environment.h"
#include "base/system/StandardStreams.h"
#include "host/files/Streams.h"

namespace host {

namespace {

constexpr int kJsonVersion = 1;

bool WantsColour(std::FILE* stream) {
    return base::KnowsEscapes(stream) && base::EnvironmentVariable("NO_COLOR").value_or("").empty();
}

ProgressStyle Style(const Reporter::Options& options) {
    return options.verbosity == Verbosity::Quiet ? ProgressStyle::None
                                                 : ChooseStyle(options.progress, stderr);
}

}  // namespace

Reporter::Reporter(const Options& options)
    : options_(options),
      out_(options.json ? stderr : stdout),
      colour_(WantsColour(stderr)),
      display_(Style(options), stderr,
               [](const std::string& text) { WriteAll(base::kStandardError, text); }) {}

void Reporter::Begin(const std::string& command, const Json& target) {
    JsonLine("begin", {{"tool", "corvane-flash " CORVANE_FLASH_VERSION},
                       {"command", command},
                       {"target", target}});
}

void Reporter::Result(const std::string& text) {
    Line(out_, text);
}

void Reporter::Document(const std::string& text) {
    Line(out_, text, Breaks::Keep);
}

void Reporter::Data(const std::string& bytes) {
    Write(stdout, bytes);
}

void Reporter::Say(Verbosity level, const std::string& text) {
    if (!Hears(level)) return;
    JsonLine("message", {{"from", "host"}, {"level", "info"}, {"text", text}});
    Line(stderr, text);
}

void Reporter::WorksOn(const std::string& target) {
    if (!std::exchange(saidTarget_, true)) Say(Verbosity::Normal, target);
}

void Reporter::Listening(const std::string& address, const Json& parts) {
    JsonLine("listening", parts);
    Result(fmt::format("Listening at {}; Ctrl-C ends it", address));
}

void Reporter::PluginMessage(Verbosity level, const std::string& text) {
    JsonLine("message", {{"from", "plug-in"}, {"level", "info"}, {"text", text}});
    if (Hears(level)) Line(stderr, text, Breaks::Keep);
}

void Reporter::PluginError(Verbosity level, const std::string& text) {
    JsonLine("message", {{"from", "plug-in"}, {"level", "error"}, {"text", text}});
    if (Hears(level)) ClosingError(text);
}

void Reporter::Error(const std::string& text) {
    JsonLine("message", {{"from", "host"}, {"level", "error"}, {"text", text}});
    ClosingError(text);
}

void Reporter::ClosingError(const std::string& text) {
    const char* name = colour_ ? "\033[1;31mcorvane-flash:\033[0m " : "corvane-flash: ";
    Write(stderr, name + Printable(text) + "\n");
}

void Reporter::Progress(Phase phase, const PhaseProgress& progress) {
    if (progress.totalBytes == 0) return;
    display_.DrawPlain(phase, progress);
    if (!gate_.Passes(phase, progress, std::chrono::steady_clock::now())) return;
    JsonLine("progress", {{"phase", Name(phase).id},
                          {"done", progress.doneBytes},
                          {"total", progress.totalBytes},
                          {"percent", progress.Percent()}});
    display_.DrawBar(phase, progress);
}

void Reporter::End(const Outcome& outcome) {
    display_.Clear();
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - start_;
    JsonLine("end", {{"status", static_cast<int>(outcome.status)},
                     {"ok", outcome.status == ExitStatus::Done},
                     {"error", outcome.error.empty() ? Json(nullptr) : Json(outcome.error)},
                     {"result", outcome.result},
                     {"seconds", SecondsJson(elapsed.count())}});
}

void Reporter::JsonLine(const char* event, const Json& members) {
    if (!options_.json) return;
    Json line{{"version", kJsonVersion}, {"event", event}};
    line.update(members);
    // File names need not be UTF-8; what isn't is replaced.
    Write(stdout, PrintableJson(line.dump(-1, ' ', false, Json::error_handler_t::replace)) + "\n");
}

void Reporter::Line(std::FILE* stream, const std::string& text, Breaks breaks) {
    Write(stream, Printable(text, breaks) + "\n");
}

// What can't be written to standard error is lost, and the work goes on.
void Reporter::Write(std::FILE* stream, const std::string& text) {
    display_.Clear();
    const int error =
        WriteAll(stream == stdout ? base::kStandardOutput : base::kStandardError, text);
    if (stream == stdout && outputError_ == 0) outputError_ = error;
}

}  // namespace host
