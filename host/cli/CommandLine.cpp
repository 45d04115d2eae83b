// What stands in the line comes first, then what the environment adds to it.

#include "host/cli/CommandLine.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>

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

/// What other programmers' tools call something else.
constexpr struct {
    const char* word;
    const char* advice;
} kElsewhere[] = {
    {"flash", "here it is 'program'"},
    {"write", "here it is 'program'"},
    {"load", "here it is 'program'"},
    {"dump", "here it is 'read'"},
    {"version", "here it is --version"},
    {"--verify", "'program' compares by itself, and 'verify' is a command of its own"},
    {"--reset", "'reset' is a command of its own, and 'program --run' resets the device"},
};

/// What to do about a stray word, as far as it is known.
std::string StrayAdvice(const CommandRows& commands, const FollowedLine& line) {
    const StrayWord& first = line.strays.front();
    if (first.isLiteral) return "";
    const std::string name = first.text.substr(0, first.text.find('='));
    if (line.command != nullptr && line.FindOption(name) != nullptr)
        return fmt::format("; write it behind '{}'", line.name);
    for (const auto& [word, advice] : kElsewhere)
        if (name == word && (IsOption(name) || line.command == nullptr))
            return fmt::format("; {}", advice);
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

/// An option that the command would do nothing with.
std::string UselessOption(const FollowedLine& line) {
    if (line.command == nullptr || line.command->needs == Needs::Device) return "";
    const bool served = line.command->needs == Needs::ServedTarget;
    for (const GivenOption& given : line.given) {
        const std::string name = given.row->LongName();
        const bool used = served && (line.Has("--gdb") || line.Has("--board"));
        if (given.row->isForPlugin && !used)
            return fmt::format("{}: '{}' does nothing with it; leave it out", name, line.name);
    }
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
    if (std::string useless = UselessOption(line); !useless.empty()) return useless;
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
        if (!given.value.empty()) continue;  // "--help=x" is a mistake
        if (name == "--help") return HelpText(commands, line.name);
        if (name == "--version") return "corvane-flash " CORVANE_FLASH_VERSION "\n";
        if (name == "--man") return ManPage(commands);
    }
    return "";
}

bool Has(const GivenOptions& given, const std::string& name) {
    return std::any_of(given.begin(), given.end(),
                       [&](const GivenOption& one) { return one.row->LongName() == name; });
}

/// Whether an option is heard that something weaker gives than all that is `given`.
bool IsHeard(const OptionRow& row, const GivenOptions& given) {
    if (!row.isRepeated && Has(given, row.LongName())) return false;
    return std::none_of(row.contraries.begin(), row.contraries.end(),
                        [&](const std::string& name) { return Has(given, name); });
}

void PutBelow(GivenOptions& given, GivenOptions weaker) {
    std::erase_if(weaker, [&](const GivenOption& one) { return !IsHeard(*one.row, given); });
    given.insert(given.begin(), weaker.begin(), weaker.end());
}

void DropWhatMeansNothing(GivenOptions& given) {
    std::erase_if(given, [&](const GivenOption& one) {
        return one.by != GivenBy::Line && *one.row->needs != '\0' && !Has(given, one.row->needs);
    });
}

/// Whoever has set a variable to nothing has meant something else than no variable.
void RequireNoneEmpty(const GivenOptions& given) {
    for (const auto& [row, text, by] : given) {
        if (by != GivenBy::Environment || !text.empty()) continue;
        std::vector<std::string> options = row->contraries;
        options.insert(options.begin(), row->LongName());
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("the environment variable {} is set and empty; unset it, or say "
                                  "{}",
                                  row->environment, fmt::join(options, " or ")));
    }
}

/// A GDB server is meant only where it was typed.
bool IsServed(const CommandRow& command) {
    return command.needs == Needs::ServedTarget;
}

GivenOptions OfEnvironment(const CommandRow& command, const ReadVariable& environment) {
    GivenOptions given;
    for (const OptionRow& row : CommonRows())
        if (*row.environment != '\0' && !(IsServed(command) && row.LongName() == "--gdb"))
            if (const auto text = environment(row.environment))
                given.push_back({&row, *text, GivenBy::Environment});
    return given;
}

GivenOptions OfBoard(const Board& board) {
    GivenOptions given;
    for (const auto& [name, text] : board.options)
        for (const OptionRow& row : CommonRows())
            if (row.LongName() == name) given.push_back({&row, text, GivenBy::Board});
    return given;
}

bool NamesTarget(const GivenOptions& given) {
    return Has(given, "--gdb") || Has(given, "--sim") || Has(given, "--sim-file");
}

/// What the environment and a board add to what was typed.
GivenOptions WithWhatIsAround(const FollowedLine& line, const ReadVariable& environment,
                              const ProjectFile& project, SettingTexts& settings) {
    GivenOptions given = line.given;
    const std::string typed = ValuesOf(CommonOptionTable(), given).board.value_or("");
    settings = project.settings;
    const auto putBoard = [&](const std::string& name) {
        const Board& board = project.RequireBoard(name);
        settings = board.settings;
        PutBelow(given, OfBoard(board));
    };
    if (!typed.empty()) putBoard(typed);
    PutBelow(given, OfEnvironment(*line.command, environment));
    const bool mayHaveDefault = typed.empty() && !IsServed(*line.command);
    if (mayHaveDefault && !project.defaultBoard.empty() && !NamesTarget(given))
        putBoard(project.defaultBoard);
    DropWhatMeansNothing(given);
    if (line.command->needs >= Needs::ServedTarget) RequireNoneEmpty(given);
    return given;
}

/// Says where those options come from that weren't typed.
void Place(CommonOptions& common, const GivenOptions& given, const std::string& project) {
    for (const auto& [row, text, by] : given) {
        if (by == GivenBy::Environment && !row->contraries.empty())
            common.targetVariables.emplace_back(row->environment);
        if (by == GivenBy::Environment)
            common.placed.push_back({row->LongName(), text, "environment"});
        if (by == GivenBy::Board) common.placed.push_back({row->LongName(), text, project});
    }
}

}  // namespace

ParsedLine ParseCommandLine(const CommandRows& commands, const FollowedLine& line,
                            const ReadVariable& environment, const ReadProject& project) {
    ParsedLine parsed;
    parsed.answer = Answer(commands, line);
    if (!parsed.answer.empty()) return parsed;
    RefuseNonsense(commands, line);
    parsed.command = line.command;
    const ProjectFile found = line.command->needs != Needs::Nothing ? project() : ProjectFile();
    parsed.project.path = found.path;
    parsed.given = WithWhatIsAround(line, environment, found, parsed.project.texts);
    parsed.common = ValuesOf(CommonOptionTable(), parsed.given);
    Place(parsed.common, parsed.given, found.path);
    return parsed;
}

}  // namespace host
