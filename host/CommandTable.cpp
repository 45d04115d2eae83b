// See CommandTable.h.

#include "host/CommandTable.h"

#include <string_view>

#include "host/commands/Commands.h"

namespace host {

const std::vector<OptionRow>& GlobalOptions() {
    static const std::vector<OptionRow> options{
        {"--sim",
         "CLASS[,OPTION=VALUE...]",
         "The simulated device to work on (there is no other target yet); default: tolva, or what "
         "--sim-file holds",
         &Options::sim,
         Offers::Devices,
         {},
         false,
         "CORVANE_SIM"},
        {"--sim-file",
         "PATH",
         "Keep the simulated device's contents in this file between runs",
         &Options::simFile,
         Offers::Files,
         {},
         false,
         "CORVANE_SIM_FILE"},
        {"--settings", "FILE", "Settings file instead of ~/.config/corvane-flash/settings.toml",
         &Options::settingsFile, Offers::Files},
        {"--set", "KEY=TEXT", "Set one of the plug-in's settings for this run; may be repeated",
         &Options::set, Offers::SettingAssignments},
        {"--plugin",
         "FILE",
         "The plug-in library, instead of the one installed with the tool",
         &Options::plugin,
         Offers::Files,
         {},
         false,
         "CORVANE_PLUGIN"},
        {"--trace", "FILE",
         "Write the plug-in's trace lines and all host calls to FILE (- is standard error)",
         &Options::trace, Offers::Files},
        {"--progress",
         "MODE",
         "How progress is shown: auto, bar, plain (for logs), none",
         &Options::progress,
         Offers::Nothing,
         {"auto", "bar", "plain", "none"}},
        {"--json", "", "One JSON object a line on standard output, all else on standard error",
         &Options::json},
        {"-q,--quiet", "", "Say nothing but results and errors", &Options::quiet},
        {"-v,--verbose", "", "Say more; twice: the plug-in's own verbose messages, too",
         &Options::verbose},
    };
    return options;
}

const std::vector<CommandRow>& AllCommands() {
    using namespace commands;
    static const std::vector<CommandRow> table{
        Info(),     Program(),      Verify(),          Read(),    Erase(),      BlankCheck(),
        Checksum(), RegisterRead(), RegisterProgram(), MacRead(), MacProgram(), Operation(),
        Settings(), Completion(),
    };
    return table;
}

const char* GroupHelp(const std::string& word) {
    return std::string_view(word) == "mac" ? "Read or program the MAC address"
                                           : "Read or program a user register";
}

namespace commands {

OptionRow RangeOption(const char* help) {
    return {"--range", "A-B", help, &Options::range};
}

OptionRow ImagesArgument() {
    return {"FILE", "", "Image files, joined before use", &Options::files, Offers::Files, {}, true};
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
    return {"--base", "ADDRESS", "Where a raw binary goes (hexadecimal)", &Options::base};
}

OptionRow DryRunOption() {
    return {"--dry-run", "", "Show what would be done, and touch nothing", &Options::dryRun};
}

OptionRow CommitOption() {
    return {"--commit", "", "Make the value survive a reset", &Options::commit};
}

}  // namespace commands

}  // namespace host
