// What may stand at the cursor of a command line, found in the tables of commands and options. The
// scripts of the shells ask for it.

#pragma once

#include <optional>
#include <string>
#include <vector>

#include "host/cli/CommandTable.h"

namespace host {

struct Completions {
    struct Word {
        std::string text;  ///< stands for the whole word at the cursor
        std::string help;

        bool operator==(const Word&) const = default;
    };
    std::vector<Word> words;  ///< whatever their beginning is
    /// When files may stand there as well: what of the word comes before their names, often "".
    std::optional<std::string> filesBehind;
};

/// `line` without the tool's name; its last word is the one at the cursor.
Completions Complete(const CommandRows& commands, const std::vector<std::string>& line);

}  // namespace host
