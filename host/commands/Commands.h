// One function for each command, defined in the file of its name: it makes the command's row in the
// table.

#pragma once

#include "host/CommandTable.h"

namespace host::commands {

CommandSpec Info();
CommandSpec Program();
CommandSpec Verify();
CommandSpec Read();
CommandSpec Erase();
CommandSpec BlankCheck();
CommandSpec Checksum();
CommandSpec RegisterRead();
CommandSpec RegisterProgram();
CommandSpec MacRead();
CommandSpec MacProgram();
CommandSpec Operation();
CommandSpec Settings();
CommandSpec Completion();

// Options that several commands share.
OptionSpec RangeOption(const char* help);
OptionSpec ImagesArgument();
OptionSpec FormatOption();
OptionSpec BaseOption();
OptionSpec DryRunOption();
OptionSpec CommitOption();

}  // namespace host::commands
