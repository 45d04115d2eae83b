// A command line followed word by word through the tables of commands and options. The parser reads
// from it what was asked for, the completion what may come next.
//
// A word is the first of these that fits:
// - the value of `awaited`, when the option before it takes one: any word but "--"
// - "--", the end of the options
// - an option: it begins with "-", isn't "-" itself, and the options haven't ended
// - a word of the command's name, until `name` is that of a command
// - an argument, while the command takes one more
// - a stray: it has no place in the line. No word behind a stray names the command, unless the
//   stray looks like an option.

#pragma once

#include <span>
#include <string>
#include <vector>

#include "host/cli/CommandTable.h"

namespace host {

struct StrayWord {
    std::string text;
    bool isLiteral;  ///< it stands behind "--"
};

struct FollowedLine {
    std::string name;  ///< of the command, as far as it goes: "", "mac", "mac read"
    const CommandRow* command = nullptr;  ///< null while `name` isn't that of one
    GivenOptions given;                   ///< in the order of the line
    std::vector<StrayWord> strays;
    std::string complaint;               ///< of the first value that can't be: which, and why
    const OptionRow* awaited = nullptr;  ///< the option whose value is the next word
    bool optionsEnded = false;

    /// Whether an option is given, by its long name.
    bool Has(const std::string& name) const;

    /// Whether the next word may be one of the command's name.
    bool MayNameCommand() const;

    /// Where the next argument goes; null when the command takes no more.
    const OptionRow* NextArgument() const;

    /// The option of a name, long or short; the command's own go first. Null for none.
    const OptionRow* FindOption(const std::string& name) const;
};

/// `words` without the tool's name. The line keeps pointers into `commands`.
FollowedLine FollowLine(const CommandRows& commands, std::span<const std::string> words);

/// What is wrong with an option that stands without its value.
std::string ValueMissing(const OptionRow& row);

/// Whether a word would be an option where options may stand.
bool IsOption(const std::string& word);

}  // namespace host
