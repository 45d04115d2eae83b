// The parsing itself is CLI11's, fed from the tables of commands and options.

#include "host/cli/CommandLine.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdlib>
#include <memory>
#include <type_traits>

#include "host/base/Errors.h"
#include "host/base/Suggestion.h"
#include "host/cli/Help.h"
#include "host/cli/ManPage.h"
#include "host/cli/Words.h"

namespace host {

namespace {

// What stands behind "--" is an argument, whatever it begins with. CLI11 would make an option of it
// again where the command has no place for it, so that it gets a mark that no typed word can hold.
constexpr char kMark = '\0';

bool IsMarked(const std::string& word) {
    return word.starts_with(kMark);
}

std::string Unmarked(const std::string& word) {
    return IsMarked(word) ? word.substr(1) : word;
}

/// CLI11 would also look for the value of "--option=" in the next word.
std::vector<std::string> WordsForParser(const std::vector<std::string>& words) {
    std::vector<std::string> prepared;
    bool behind = false;
    for (const std::string& word : words) {
        if (behind)
            prepared.push_back(kMark + word);
        else if (word.size() > 3 && word.starts_with("--") && word.find('=') == word.size() - 1)
            prepared.insert(prepared.end(), {word.substr(0, word.size() - 1), ""});
        else if (word != "--")
            prepared.push_back(word);
        behind = behind || word == "--";
    }
    return prepared;
}

/// CLI11 lets arguments have few characters in their names: of "[HOST:]PORT" it sees PORT.
std::string NamesForParser(const OptionRow& row) {
    const std::string names = row.names;
    return names.substr(names.find(']') + 1);
}

/// Texts are taken as they come, an empty one too, and the last of several counts.
template <typename Text>
CLI::Option* DefineText(CLI::App& app, const OptionRow& row, Text& target) {
    CLI::Option* option = app.add_option_function<std::string>(
        NamesForParser(row), [&target](const std::string& text) { target = text; });
    return option->multi_option_policy(CLI::MultiOptionPolicy::TakeLast);
}

CLI::Option* DefineTexts(CLI::App& app, const OptionRow& row, std::vector<std::string>& target) {
    return app.add_option(NamesForParser(row), target)->allow_extra_args(row.IsArgument());
}

CLI::Option* DefineMember(CLI::App& app, const OptionRow& row, Options& options) {
    return std::visit(
        [&](auto member) -> CLI::Option* {
            auto& target = options.*member;
            using Target = std::remove_reference_t<decltype(target)>;
            if constexpr (std::is_same_v<Target, bool> || std::is_same_v<Target, int>)
                return app.add_flag(row.names, target);
            else if constexpr (std::is_same_v<Target, std::vector<std::string>>)
                return DefineTexts(app, row, target);
            else
                return DefineText(app, row, target);
        },
        row.member);
}

bool IsTyped(const std::string& option, const std::vector<std::string>& words) {
    return std::any_of(words.begin(), words.end(), [&](const std::string& word) {
        return word == option || word.starts_with(option + "=");
    });
}

bool HasTypedRival(const OptionRow& row, const std::vector<std::string>& words) {
    return std::any_of(row.rivals.begin(), row.rivals.end(),
                       [&](const std::string& rival) { return IsTyped(rival, words); });
}

std::string NoValue(const std::string& text) {
    return IsMarked(text) ? "its value is missing" : "";
}

std::string NoFileName(const std::string& text) {
    return text.empty() ? "the name of the file is empty" : "";
}

void Define(CLI::App& app, const OptionRow& row, Options& options) {
    CLI::Option* option = DefineMember(app, row, options);
    option->required(row.required);
    if (!row.choices.empty() && row.offers != Offers::SomeChoices)
        option->check(CLI::IsMember(row.choices));
    if (row.offers == Offers::Files) option->check(NoFileName);
    if (row.IsArgument())
        option->transform(Unmarked);
    else if (!row.IsSwitch())
        option->check(NoValue);
}

void TakeEnvironment(CLI::App& app, const OptionRow& row, const std::vector<std::string>& words,
                     Options& options) {
    const std::string name = SplitNames(row).back();
    if (*row.environment == '\0' || HasTypedRival(row, words)) return;
    app.get_option(name)->envname(row.environment);
    const char* text = std::getenv(row.environment);
    if (!row.rivals.empty() && !IsTyped(name, words) && text != nullptr && *text != '\0')
        options.targetVariables.emplace_back(row.environment);
}

/// The app of a command; for one of two words, below the app of the first word.
CLI::App* AddCommand(CLI::App& app, const CommandRow& row) {
    const std::string name = row.name;
    const auto blank = name.find(' ');
    CLI::App* parent = &app;
    if (blank != std::string::npos) {
        const std::string word = name.substr(0, blank);
        const auto known =
            app.get_subcommands([&](CLI::App* group) { return group->get_name() == word; });
        parent = known.empty() ? app.add_subcommand(word) : known.front();
        parent->fallthrough()->require_subcommand(1);
    }
    return parent->add_subcommand(name.substr(blank + 1))->fallthrough();
}

/// The words of the command that the parser has come to.
std::string CommandWords(const CLI::App& app) {
    const auto chosen = app.get_subcommands();
    if (chosen.empty()) return "";
    const std::string rest = CommandWords(*chosen.front());
    return chosen.front()->get_name() + (rest.empty() ? "" : " ") + rest;
}

struct Parser {
    CLI::App app;
    Options options;
    const CommandRow* chosen = nullptr;
    bool man = false;

    Parser(const CommandRows& commands, const std::vector<std::string>& words) {
        app.set_version_flag("--version", std::string("corvane-flash " CORVANE_FLASH_VERSION));
        app.add_flag("--man", man);
        app.require_subcommand(0, 1);
        for (const OptionRow& row : GlobalOptions()) {
            Define(app, row, options);
            TakeEnvironment(app, row, words, options);
        }
        for (const CommandRow& row : commands) {
            CLI::App* command = AddCommand(app, row);
            for (const OptionRow& option : row.options)
                Define(*command, option, options);
            command->callback([this, &row] { chosen = &row; });
        }
    }
};

/// What could stand in the place of a word: options, or commands.
std::vector<std::string> KnownWords(const CommandRows& commands, const std::string& command,
                                    const std::string& word) {
    if (!word.starts_with('-'))
        return command.empty() ? FirstWords(commands) : std::vector<std::string>();
    std::vector<std::string> known{"--help", "--version", "--man"};
    const auto add = [&](const std::vector<OptionRow>& rows) {
        for (const OptionRow& row : rows)
            if (!row.IsArgument()) known.push_back(SplitNames(row).back());
    };
    add(GlobalOptions());
    for (const CommandRow& row : commands)
        if (command == row.name) add(row.options);
    return known;
}

/// CLI11 speaks in several lines and of subcommands; people want one line and commands.
std::string OneLine(const CommandRows& commands, const CLI::ParseError& error,
                    const std::string& command, const std::vector<std::string>& surplus) {
    const auto below = SecondWords(commands, command);
    if (!below.empty()) return fmt::format("{} what? {}", command, fmt::join(below, " or "));
    std::string text = error.what();
    std::replace(text.begin(), text.end(), '\n', ' ');
    if (dynamic_cast<const CLI::ExtrasError*>(&error) == nullptr || surplus.empty()) return text;
    const std::string& first = surplus.front();
    std::vector<std::string> words(surplus.size());
    std::transform(surplus.begin(), surplus.end(), words.begin(), Unmarked);
    return fmt::format(
        "{}: {}{}", command.empty() ? "unknown command or option" : "not expected here",
        fmt::join(words, " "),
        IsMarked(first) ? "" : Suggestion(first, KnownWords(commands, command, first)));
}

[[noreturn]] void Refuse(const CommandRows& commands, const CLI::ParseError& error,
                         const CLI::App& app) {
    const std::string command = CommandWords(app);
    throw Failure(ExitStatus::WrongUsage,
                  fmt::format("{}; 'corvane-flash {}{}--help' shows what there is",
                              OneLine(commands, error, command, app.remaining(true)), command,
                              command.empty() ? "" : " "));
}

}  // namespace

ParsedLine ParseCommandLine(const CommandRows& commands, std::vector<std::string> words) {
    words = WordsForParser(words);
    Parser parser(commands, words);
    const bool gdbTyped = IsTyped("--gdb", words);
    std::reverse(words.begin(), words.end());  // CLI11 takes them from the back
    try {
        parser.app.parse(words);
    } catch (const CLI::CallForHelp&) {
        return {{}, nullptr, HelpText(commands, CommandWords(parser.app))};
    } catch (const CLI::CallForVersion& version) {
        return {{}, nullptr, std::string(version.what()) + "\n"};
    } catch (const CLI::ParseError& error) {
        Refuse(commands, error, parser.app);
    }
    if (parser.man) return {{}, nullptr, ManPage(commands)};
    if (parser.chosen == nullptr)
        throw Failure(ExitStatus::WrongUsage,
                      "which command? 'corvane-flash --help' lists them, for example "
                      "'corvane-flash program firmware.elf'");
    parser.options.command = parser.chosen->name;
    if (parser.chosen->isForSimulated && !gdbTyped) parser.options.gdb.reset();
    return {parser.options, parser.chosen, ""};
}

}  // namespace host
