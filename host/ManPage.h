// The man page, generated from the tables of commands and options.

#pragma once

#include <string>

namespace host {

/// corvane-flash(1) in roff.
std::string ManPage();

}  // namespace host
