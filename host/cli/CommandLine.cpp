// What stands in the line comes first, then what the environment adds to it.

#include "host/cli/CommandLine.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <cstdlib>

#include "host/base/Errors.h"
#include "host/base/Suggestion.h"
#include "host/cli/Help.h"
#include "host/cli/ManPage.h"
#include "host/cli/Words.h"

namespace host {

namespace {

/// What could stand in the place of a stray word: options, or commands.
std::vector<std::string> KnownWords(const CommandRows& commands, const FollowedLine& line,
                                    const std::string& stray) {
    if (!IsOption(stray))
        return line.command == nullptr ? FirstWords(commands) : std::vector<std::string>();
    std::vector<std::string> known;
    const auto add = [&](const std::vector<OptionRow>& rows) {
        for (const OptionRow& row : rows)
            if (!row.IsArgument()) known.push_back(row.LongName());
    };
    add(AnsweredRows());
    add(CommonRows());
    if (line.command != nullptr) add(line.command->options);
    return known;
}

/// What to do about a stray word, as far as it is known.
std::string StrayAdvice(const CommandRows& commands, const FollowedLine& line) {
    const StrayWord& first = line.strays.front();
    if (first.isLiteral) return "";
    const std::string name = first.text.substr(0, first.text.find('='));
    if (line.command != nullptr && line.FindOption(name) != nullptr)
        return fmt::format("; write it behind '{}'", line.name);
    return Suggestion(name, KnownWords(commands, line, name));
}

std::string StrayText(const CommandRows& commands, const FollowedLine& line) {
    std::vector<std::string> words;
    for (const StrayWord& stray : line.strays)
        words.push_back(stray.text);
    return fmt::format("{}: {}{}",
                       line.command == nullptr ? "unknown command or option" : "not expected here",
                       fmt::join(words, " "), StrayAdvice(commands, line));
}

std::string MissingArgument(const FollowedLine& line) {
    for (const OptionRow& row : line.command->options)
        if (row.isRequired && !line.Has(row.LongName()))
            return fmt::format("{} is required", row.LongName());
    return "";
}

/// What is wrong with the line, empty when nothing is. A line without a command is another matter.
std::string Complaint(const CommandRows& commands, const FollowedLine& line) {
    const auto below = SecondWords(commands, line.name);
    if (line.command == nullptr && !below.empty())
        return fmt::format("{} what? {}", line.name, fmt::join(below, " or "));
    if (!line.complaint.empty()) return line.complaint;
    if (line.awaited != nullptr) return ValueMissing(*line.awaited);
    if (!line.strays.empty()) return StrayText(commands, line);
    return line.command == nullptr ? "" : MissingArgument(line);
}

void RefuseNonsense(const CommandRows& commands, const FollowedLine& line) {
    const std::string complaint = Complaint(commands, line);
    if (!complaint.empty())
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{}; 'corvane-flash {}{}--help' shows what there is", complaint,
                                  line.name, line.name.empty() ? "" : " "));
    if (line.command == nullptr)
        throw Failure(ExitStatus::WrongUsage,
                      "which command? 'corvane-flash --help' lists them, for example "
                      "'corvane-flash program firmware.elf'");
}

/// What the first of the answered options asks for; empty when there is none.
std::string Answer(const CommandRows& commands, const FollowedLine& line) {
    for (const GivenOption& given : line.given) {
        const std::string name = given.row->LongName();
        if (name == "--help") return HelpText(commands, line.name);
        if (name == "--version") return "corvane-flash " CORVANE_FLASH_VERSION "\n";
        if (name == "--man") return ManPage(commands);
    }
    return "";
}

/// A variable counts unless its option is typed, or one that contradicts it.
bool HeedsEnvironment(const OptionRow& row, const FollowedLine& line) {
    if (*row.environment == '\0' || line.Has(row.LongName())) return false;
    if (line.command->ignoresGdbVariable && row.LongName() == "--gdb") return false;
    return std::none_of(row.contraries.begin(), row.contraries.end(),
                        [&](const std::string& name) { return line.Has(name); });
}

std::vector<GivenOption> WithEnvironment(const FollowedLine& line,
                                         const ReadVariable& environment) {
    std::vector<GivenOption> given = line.given;
    for (const OptionRow& row : CommonRows())
        if (HeedsEnvironment(row, line))
            if (const std::string text = environment(row.environment); !text.empty())
                given.push_back({&row, text, true});
    return given;
}

}  // namespace

std::string ProcessEnvironment(const char* name) {
    const char* text = std::getenv(name);
    return text == nullptr ? "" : text;
}

ParsedLine ParseCommandLine(const CommandRows& commands, const FollowedLine& line,
                            const ReadVariable& environment) {
    ParsedLine parsed;
    parsed.answer = Answer(commands, line);
    if (!parsed.answer.empty()) return parsed;
    RefuseNonsense(commands, line);
    parsed.command = line.command;
    parsed.given = WithEnvironment(line, environment);
    parsed.common = ValuesOf(CommonOptionTable(), parsed.given);
    for (const GivenOption& given : parsed.given)
        if (given.isFromEnvironment && !given.row->contraries.empty())
            parsed.common.targetVariables.emplace_back(given.row->environment);
    return parsed;
}

}  // namespace host
