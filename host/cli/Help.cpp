// The tool's own help fits a screen of 24 lines; everything else is a command's or a topic's.

#include "host/cli/Help.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <string>
#include <string_view>
#include <vector>

#include "host/base/Errors.h"
#include "host/cli/CommandTable.h"
#include "host/cli/Layout.h"
#include "host/cli/Topics.h"
#include "host/cli/Words.h"

namespace host {

namespace {

constexpr std::size_t kCommandColumns = 15;

std::string CommandHelp(const CommandRow& command) {
    std::string arguments;
    std::string options;
    for (const OptionRow& row : command.options)
        (row.IsArgument() ? arguments : options) += OptionEntry(row);
    std::string text = fmt::format("{}.\n\nUsage: corvane-flash {}\n", command.help,
                                   fmt::join(UsageWords(command), " "));
    if (*command.details != '\0') text += "\n" + Wrap(command.details);
    if (!arguments.empty()) text += "\nArguments:\n" + arguments;
    if (!options.empty()) text += "\nOptions:\n" + options;
    return text + fmt::format(
                      "\nExample:\n{}\n\nOptions of every command: corvane-flash help "
                      "options\n",
                      command.example);
}

std::string GroupText(const CommandRows& commands, const std::string& word) {
    std::string text =
        fmt::format("{}.\n\nUsage: corvane-flash {} COMMAND\n\nCommands:\n", GroupHelp(word), word);
    for (const CommandRow& command : commands)
        if (std::string_view(command.name).starts_with(word + " "))
            text += Entry(command.name, command.help);
    return text + fmt::format("\n'corvane-flash help {} COMMAND' tells more.\n", word);
}

std::string ToolHelp(const CommandRows& commands) {
    std::string text = "Usage: corvane-flash [OPTION]... COMMAND [ARGUMENT]...\n\n";
    for (const std::string& word : FirstWords(commands))
        text += Entry(word, FirstWordHelp(commands, word), kCommandColumns);
    std::string topics;
    for (const Topic& topic : Topics())
        topics += fmt::format("{}{}", topics.empty() ? "" : ", ", topic.name);
    return text + Wrap("The options that every command takes: 'help options'; --version") +
           Wrap(fmt::format("'help COMMAND' tells more, 'help TOPIC' too: {}", topics)) +
           Wrap("Example: corvane-flash program firmware.elf");
}

}  // namespace

std::string HelpText(const CommandRows& commands, const std::string& word) {
    if (word.empty()) return ToolHelp(commands);
    for (const CommandRow& command : commands)
        if (word == command.name) return CommandHelp(command);
    for (const Topic& topic : Topics())
        if (word == topic.name) return topic.text();
    if (!SecondWords(commands, word).empty()) return GroupText(commands, word);
    throw Failure(
        ExitStatus::WrongUsage,
        fmt::format("there is no help on '{}'; 'corvane-flash help' lists what there is", word));
}

}  // namespace host
