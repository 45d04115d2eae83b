// All commands in the order of the help.

#include "host/commands/Commands.h"

namespace host {

const CommandRows& AllCommands() {
    using namespace commands;
    static const CommandRows table{
        Info(),
        Check(),
        Program(),
        Verify(),
        Map(),
        Read(),
        Erase(),
        BlankCheck(),
        Checksum(),
        RegisterRead(),
        RegisterProgram(),
        MacRead(),
        MacProgram(),
        Operation(),
        Reset(),
        Serve(),
        Settings(),
        Completion(),
        Help(),
    };
    return table;
}

}  // namespace host
