// Laying out the tables of commands and options for a terminal of 79 columns.

#include "host/cli/Help.h"

#include <fmt/format.h>

#include <algorithm>
#include <sstream>
#include <string>
#include <string_view>
#include <vector>

#include "host/base/Errors.h"
#include "host/cli/CommandTable.h"
#include "host/cli/Words.h"
#include "target/simulated/DeviceOptions.h"

namespace host {

namespace {

constexpr std::size_t kLineColumns = 79;
constexpr std::size_t kTermColumns = 24;

/// Words from `text`, wrapped so that all lines but the first are indented.
std::string Wrap(std::string_view text, std::size_t column, std::size_t indent) {
    std::string lines;
    while (!text.empty()) {
        const std::string_view word = text.substr(0, text.find(' '));
        const bool first = column <= indent;
        if (!first && column + 1 + word.size() > kLineColumns) {
            lines += "\n" + std::string(indent, ' ');
            column = indent;
        } else if (!first) {
            lines += ' ';
            ++column;
        }
        lines += word;
        column += word.size();
        text.remove_prefix(std::min(text.size(), word.size() + 1));
    }
    return lines + "\n";
}

/// A term and what it means: beside it, or below one that is too long.
std::string Entry(const std::string& term, std::string_view text) {
    std::string line = "  " + term;
    if (line.size() + 1 < kTermColumns)
        line.append(kTermColumns - line.size(), ' ');
    else
        line += "\n" + std::string(kTermColumns, ' ');
    return line + Wrap(text, kTermColumns, kTermColumns);
}

std::string OptionEntry(const OptionRow& row) {
    const std::vector<std::string> names = SplitNames(row);
    std::string term = names.front();
    if (names.size() > 1)
        term += ", " + names.back();
    else if (!row.IsArgument())
        term.insert(0, 4, ' ');
    std::string help = row.help;
    if (*row.value != '\0') term += fmt::format(" {}", row.value);
    if (*row.environment != '\0') help += fmt::format(" [environment: {}]", row.environment);
    return Entry(term, help);
}

std::string CommandHelp(const CommandRow& command) {
    std::string usage = fmt::format("Usage: corvane-flash {}", command.name);
    std::string arguments;
    std::string options;
    for (const OptionRow& row : command.options) {
        (row.IsArgument() ? arguments : options) += OptionEntry(row);
        if (!row.IsArgument()) continue;
        const bool several =
            std::holds_alternative<std::vector<std::string> Options::*>(row.member);
        usage += fmt::format(fmt::runtime(row.required ? " {}{}" : " [{}{}]"), row.names,
                             several ? "..." : "");
    }
    if (!options.empty()) usage += " [OPTION]...";
    std::string text = fmt::format("{}.\n\n{}\n", command.help, usage);
    if (*command.details != '\0') text += "\n" + Wrap(command.details, 0, 0);
    if (!arguments.empty()) text += "\nArguments:\n" + arguments;
    if (!options.empty()) text += "\nOptions:\n" + options;
    return text + fmt::format("\nExample:\n{}\n\nOptions of every command: corvane-flash --help\n",
                              command.example);
}

std::string GroupText(const CommandRows& commands, const std::string& word) {
    std::string text =
        fmt::format("{}.\n\nUsage: corvane-flash {} COMMAND\n\nCommands:\n", GroupHelp(word), word);
    for (const CommandRow& command : commands)
        if (std::string_view(command.name).starts_with(word + " "))
            text += Entry(command.name, command.help);
    return text + fmt::format("\n'corvane-flash {} COMMAND --help' tells more.\n", word);
}

/// The target's own help, wrapped like the rest: headings, and lines of a name and a text.
std::string DevicesHelp() {
    std::istringstream lines(target::DeviceOptionsHelp());
    std::string text;
    for (std::string line; std::getline(lines, line);) {
        const std::size_t name = line.find_first_not_of(' ');
        const std::size_t blanks = name == 0 ? std::string::npos : line.find("  ", name);
        if (blanks == std::string::npos)
            text += "\n" + line + "\n";
        else
            text += Entry(line.substr(name, blanks - name),
                          std::string_view(line).substr(line.find_first_not_of(' ', blanks)));
    }
    return text;
}

std::string ExitStatusHelp() {
    std::string text = "Exit status:\n";
    for (const auto& [status, meaning] : kExitStatuses)
        text += Entry(std::to_string(static_cast<int>(status)), meaning);
    return text;
}

std::string ToolHelp(const CommandRows& commands) {
    std::string text =
        "Programs, verifies and erases the flash of Corvane microcontrollers.\n\n"
        "Usage: corvane-flash [OPTION]... COMMAND [ARGUMENT]...\n\nCommands:\n";
    for (const std::string& word : FirstWords(commands))
        text += Entry(word, FirstWordHelp(commands, word));
    text += "\nOptions, before or behind the command:\n";
    for (const OptionRow& row : GlobalOptions())
        text += OptionEntry(row);
    text += Entry("-h, --help", "Show this help, or that of the command");
    text += Entry("    --version", "Show the version");
    return text +
           "\nExamples:\n"
           "  corvane-flash program firmware.elf\n"
           "  corvane-flash --sim quen,flash=256K --sim-file board.sim program app.hex\n"
           "  corvane-flash program --help\n\n" +
           "Addresses are hexadecimal, with or without 0x; ranges include both ends.\n\n" +
           ExitStatusHelp() + DevicesHelp();
}

}  // namespace

std::string HelpText(const CommandRows& commands, const std::string& word) {
    if (word.empty()) return ToolHelp(commands);
    for (const CommandRow& command : commands)
        if (word == command.name) return CommandHelp(command);
    return GroupText(commands, word);
}

}  // namespace host
