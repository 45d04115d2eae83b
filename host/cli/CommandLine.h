// From the words of a command line to a plain Options value.

#pragma once

#include <string>
#include <vector>

#include "host/cli/CommandTable.h"

namespace host {

struct ParsedLine {
    Options options;
    const CommandRow* command = nullptr;  ///< null: `text` is all that was asked for
    std::string text;                     ///< help, version or man page
};

/// `words` without the program's name. Failure (WrongUsage) for a line that makes no sense.
ParsedLine ParseCommandLine(const CommandRows& commands, std::vector<std::string> words);

}  // namespace host
