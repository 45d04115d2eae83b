// Picking words out of the tables of commands and options.

#include "host/cli/Words.h"

#include <algorithm>

namespace host {

std::vector<std::string> FirstWords(const CommandRows& commands) {
    std::vector<std::string> words;
    for (const CommandRow& command : commands) {
        const std::string name = command.name;
        const std::string word = name.substr(0, name.find(' '));
        if (std::find(words.begin(), words.end(), word) == words.end()) words.push_back(word);
    }
    return words;
}

std::vector<std::string> SecondWords(const CommandRows& commands, const std::string& first) {
    std::vector<std::string> words;
    for (const CommandRow& command : commands)
        if (const std::string name = command.name; name.starts_with(first + " "))
            words.push_back(name.substr(first.size() + 1));
    return words;
}

std::vector<std::string> UsageWords(const CommandRow& command) {
    std::vector<std::string> words{command.name};
    bool options = false;
    for (const OptionRow& row : command.options) {
        options = options || !row.IsArgument();
        if (!row.IsArgument()) continue;
        const std::string name = row.isRequired ? row.names : "[" + std::string(row.names) + "]";
        words.push_back(name + (row.isRepeated ? "..." : ""));
    }
    if (options) words.emplace_back("[OPTION]...");
    return words;
}

std::string FirstWordHelp(const CommandRows& commands, const std::string& word) {
    for (const CommandRow& command : commands)
        if (word == command.name) return command.help;
    return GroupHelp(word);
}

}  // namespace host
