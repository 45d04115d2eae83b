// Shell completion scripts, generated from the tables of commands and options.

#pragma once

#include <string>

namespace host {

/// The script for "bash", "zsh" or "fish".
std::string CompletionScript(const std::string& shell);

}  // namespace host
