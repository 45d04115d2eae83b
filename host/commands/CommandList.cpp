// All commands in the order of the help, and the options that several of them share.

#include "host/commands/Commands.h"

namespace host {

const CommandRows& AllCommands() {
    using namespace commands;
    static const CommandRows table{
        Info(),     Program(),    Verify(),    Map(),          Read(),
        Erase(),    BlankCheck(), Checksum(),  RegisterRead(), RegisterProgram(),
        MacRead(),  MacProgram(), Operation(), Reset(),        Serve(),
        Settings(), Completion(), Help(),
    };
    return table;
}

namespace commands {

OptionRow RangeOption(const char* help) {
    return {"--range", "A-B|A+LENGTH", help, &Options::range};
}

OptionRow ImagesArgument() {
    return {"FILE",
            "",
            "Image files, joined before use; raw binary as FILE@ADDRESS; - is standard input",
            &Options::files,
            Offers::Files,
            {},
            true};
}

OptionRow FormatOption() {
    return {"--format",
            "FORMAT",
            "Read the files as elf, ihex, srec or bin, whatever they look like",
            &Options::format,
            Offers::Nothing,
            {"elf", "ihex", "srec", "bin"}};
}

OptionRow BaseOption() {
    return {"--base", "ADDRESS", "Where the raw binary goes (hexadecimal)", &Options::base};
}

OptionRow DryRunOption() {
    return {"--dry-run", "", "Show what would be done, and touch nothing", &Options::dryRun};
}

OptionRow NoVerifyOption() {
    return {"--no-verify", "", "Leave out the read-back and comparison", &Options::noVerify};
}

OptionRow CommitOption() {
    return {"--commit", "", "Make the value survive a reset", &Options::commit};
}

OptionRow RunOption(const char* help) {
    return {"--run", "", help, &Options::run};
}

}  // namespace commands

}  // namespace host
