// The tool as a function: everything between the words of a command line and an exit status.

#pragma once

#include <string>
#include <vector>

namespace host {

/// `words` without the program's name. Returns the exit status.
int RunTool(const std::vector<std::string>& words);

}  // namespace host
