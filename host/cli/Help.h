// The help texts, generated from the tables of commands and options and wrapped for a terminal.

#pragma once

#include <string>

#include "host/cli/CommandTable.h"

namespace host {

/// The help of a command ("program", "mac read"), of the commands that share a first word ("mac"),
/// or, for an empty text, of the tool.
std::string HelpText(const CommandRows& commands, const std::string& command);

}  // namespace host
