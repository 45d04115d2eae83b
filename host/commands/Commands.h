// One function for each command, defined in the file of its name: it makes the command's row in the
// table.

#pragma once

#include "host/cli/CommandTable.h"
#include "host/commands/Context.h"

namespace host {

const CommandRows& AllCommands();

}  // namespace host

namespace host::commands {

CommandRow Info();
CommandRow Check();
CommandRow Program();
CommandRow Verify();
CommandRow Map();
CommandRow Read();
CommandRow Erase();
CommandRow BlankCheck();
CommandRow Checksum();
CommandRow RegisterRead();
CommandRow RegisterProgram();
CommandRow MacRead();
CommandRow MacProgram();
CommandRow Operation();
CommandRow Reset();
CommandRow Serve();
CommandRow Settings();
CommandRow Completion();
CommandRow Help();

}  // namespace host::commands
