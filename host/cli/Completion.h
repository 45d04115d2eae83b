// Shell completion scripts, generated from the tables of commands and options.

#pragma once

#include <string>

#include "host/cli/CommandTable.h"

namespace host {

/// The script for "bash", "zsh" or "fish".
std::string CompletionScript(const CommandRows& commands, const std::string& shell);

}  // namespace host
