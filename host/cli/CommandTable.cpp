// The options that every command takes, and the words that commands of two words begin with.

#include "host/cli/CommandTable.h"

#include <string_view>

namespace host {

const std::vector<OptionRow>& GlobalOptions() {
    static const std::vector<OptionRow> options{
        {"--sim",
         "CLASS[,OPTION=VALUE...]",
         "The simulated device to work on; default: tolva, or what --sim-file holds",
         &Options::sim,
         Offers::Devices,
         {},
         false,
         "CORVANE_SIM",
         {"--gdb"}},
        {"--sim-file",
         "PATH",
         "Keep the simulated device's contents in this file between runs",
         &Options::simFile,
         Offers::Files,
         {},
         false,
         "CORVANE_SIM_FILE",
         {"--gdb"}},
        {"--gdb",
         "HOST:PORT",
         "Work on the target behind a GDB server, in place of a simulated device; :PORT and PORT "
         "mean this machine",
         &Options::gdb,
         Offers::Nothing,
         {},
         false,
         "CORVANE_GDB",
         {"--sim", "--sim-file"}},
        {"--gdb-option", "NAME=VALUE[,NAME=VALUE...]",
         "How to deal with that server; 'help gdb' lists them; may be repeated",
         &Options::gdbOptions, Offers::GdbOptions},
        {"--loader", "FILE",
         "The flash loader's ELF file, for a target behind --gdb; default: where the plug-in looks",
         &Options::loader, Offers::Files},
        {"--settings", "FILE",
         "Settings file instead of ~/.config/corvane-flash/settings.toml; kept values go beside "
         "it, for x.toml into x.kept.toml",
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
        {"--force", "", "Write over files that exist (--trace, read)", &Options::force},
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

const std::vector<OptionRow>& AnsweredOptions() {
    static constexpr bool Options::*kNoMember = nullptr;
    static const std::vector<OptionRow> options{
        {"-h,--help", "", "Show the help, or that of the command", kNoMember},
        {"--version", "", "Show the version", kNoMember},
        {"--man", "", "Print the man page, for 'man -l -'", kNoMember},
    };
    return options;
}

const char* GroupHelp(const std::string& word) {
    return std::string_view(word) == "mac" ? "Read or program the MAC address"
                                           : "Read or program a user register";
}

}  // namespace host
