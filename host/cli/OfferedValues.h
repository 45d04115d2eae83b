// What a shell offers as the value of an option or an argument.

#pragma once

#include <string>

#include "host/cli/Completion.h"

namespace host {

/// `typed` is the value as far as it stands, `before` what comes before it in the same word.
Completions OfferedValues(const OptionRow& row, const std::string& before,
                          const std::string& typed);

}  // namespace host
