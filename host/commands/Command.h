// How a command's row is made: its texts, the options that fill its own struct, and the function
// that takes this struct.

#pragma once

#include <utility>
#include <vector>

#include "host/cli/CommandTable.h"
#include "host/cli/Option.h"
#include "host/commands/Context.h"

namespace host::commands {

/// For a command without options.
struct NoOptions {};

template <typename Options>
CommandRow Command(CommandRow row, std::vector<Option<Options>> options,
                   Outcome (*run)(Context&, const Options&)) {
    row.options = RowsOf(options);
    row.run = [options = std::move(options), run](Context& context, const GivenOptions& given) {
        return run(context, ValuesOf(options, given));
    };
    return row;
}

}  // namespace host::commands
