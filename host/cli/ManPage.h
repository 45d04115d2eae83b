// The man page, generated from the tables of commands and options.

#pragma once

#include <string>

#include "host/cli/CommandTable.h"

namespace host {

/// corvane-flash(1) in roff.
std::string ManPage(const CommandRows& commands);

}  // namespace host
