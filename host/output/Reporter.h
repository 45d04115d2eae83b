// Everything that the tool says, in one place, through which no control character from outside
// reaches a terminal: results on standard output, messages and progress on standard
// error, or JSON lines on standard output and everything else on standard error.

#pragma once

#include <chrono>
#include <string>
#include <vector>

#include "base/system/Terminal.h"
#include "host/base/Errors.h"
#include "host/base/Json.h"
#include "host/base/Printable.h"
#include "host/output/Progress.h"

namespace host {

enum class Verbosity { Quiet, Normal, Verbose, Debug };

/// How a command ended. A failure whose text has been shown already leaves `error` to the JSON.
struct Outcome {
    ExitStatus status = ExitStatus::Done;
    std::string error = {};
    Json result = Json::object();
    std::vector<std::string> details = {};  ///< lines to show below the error
    std::string done = {};                  ///< to be shown when all is done, files included
};

class Reporter {
  public:
    struct Options {
        Verbosity verbosity = Verbosity::Normal;
        bool json = false;
        std::string progress = "auto";
    };

    explicit Reporter(const Options& options);

    /// `target` is what the options name to work on, or null.
    void Begin(const std::string& command, const Json& target);

    /// What the command was run for: shown whatever the level.
    void Result(const std::string& text);

    /// The same of several lines.
    void Document(const std::string& text);

    /// The same as bytes that aren't for people, which go to standard output as they are.
    void Data(const std::string& bytes);

    /// A line for those who want to hear this much.
    void Say(Verbosity level, const std::string& text);

    /// What is worked on: said once, however often it is opened.
    void WorksOn(const std::string& target);

    /// What the command has done, the last line of its summary.
    void Done(const std::string& text) {
        if (Hears(Verbosity::Normal)) Result(text);
    }

    /// Where clients may connect from now on: as text, and its parts for JSON.
    void Listening(const std::string& address, const Json& parts);

    /// A message or an error that the plug-in shows its user.
    void PluginMessage(Verbosity level, const std::string& text);
    void PluginError(Verbosity level, const std::string& text);

    /// An error beside the one that the command ends with.
    void Error(const std::string& text);

    /// What the command ends with; the JSON's end line has it.
    void ClosingError(const std::string& text);

    /// A line of a closing error that takes several.
    void ErrorDetail(const std::string& text) { Line(stderr, text); }
    void Progress(Phase phase, const PhaseProgress& progress);
    void End(const Outcome& outcome);

    /// The error number of what couldn't be written to standard output, or 0.
    int OutputError() const { return outputError_; }

    /// How wide the terminal is that shows results.
    std::size_t Columns() const { return base::TerminalColumns(out_); }

    bool Hears(Verbosity level) const { return options_.verbosity >= level; }

  private:
    void JsonLine(const char* event, const Json& members);
    void Line(std::FILE* stream, const std::string& text, Breaks breaks = Breaks::Escape);
    void Write(std::FILE* stream, const std::string& text);

    Options options_;
    std::FILE* out_;  ///< where results go that people read
    bool colour_;
    int outputError_ = 0;
    bool saidTarget_ = false;
    UpdateGate gate_;
    ProgressDisplay display_;
    std::chrono::steady_clock::time_point start_ = std::chrono::steady_clock::now();
};

}  // namespace host
