// The words of a command line, as the tables of commands and options have them.

#pragma once

#include <string>
#include <vector>

#include "host/cli/CommandTable.h"

namespace host {

/// The words that a command line can begin with, each once.
std::vector<std::string> FirstWords(const CommandRows& commands);

/// What can follow such a word to make a command of two words.
std::vector<std::string> SecondWords(const CommandRows& commands, const std::string& first);

/// A command's line in a usage: its name, its arguments (optional ones in brackets, repeated ones
/// with dots), and whether it takes options.
std::vector<std::string> UsageWords(const CommandRow& command);

/// One line on a first word.
std::string FirstWordHelp(const CommandRows& commands, const std::string& word);

}  // namespace host
