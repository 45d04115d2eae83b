// The options that every command takes, and the words that commands of two words begin with.

#include "host/cli/CommandTable.h"

#include <string_view>

namespace host {

const std::vector<Option<CommonOptions>>& CommonOptionTable() {
    static const std::vector<Option<CommonOptions>> options{
        {&CommonOptions::sim,
         {.names = "--sim",
          .value = "CLASS[,OPTION=VALUE...]",
          .help = "The simulated device to work on; default: tolva, or what --sim-file holds",
          .offers = Offers::Devices,
          .environment = "CORVANE_SIM",
          .contraries = {"--gdb"}}},
        {&CommonOptions::simFile,
         {.names = "--sim-file",
          .value = "PATH",
          .help = "Keep the simulated device's contents in this file between runs",
          .offers = Offers::Files,
          .environment = "CORVANE_SIM_FILE",
          .contraries = {"--gdb"}}},
        {&CommonOptions::gdb,
         {.names = "--gdb",
          .value = "HOST:PORT",
          .help = "Work on the target behind a GDB server, in place of a simulated device; :PORT "
                  "and PORT mean this machine",
          .environment = "CORVANE_GDB",
          .contraries = {"--sim", "--sim-file"}}},
        {&CommonOptions::gdbOptions,
         {.names = "--gdb-option",
          .value = "NAME=VALUE[,NAME=VALUE...]",
          .help = "How to deal with that server; 'help gdb' lists them; may be repeated",
          .offers = Offers::GdbOptions,
          .needs = "--gdb"}},
        {&CommonOptions::loader,
         {.names = "--loader",
          .value = "FILE",
          .help = "The flash loader's ELF file, for a target behind --gdb; default: where the "
                  "plug-in looks",
          .offers = Offers::Files,
          .environment = "CORVANE_LOADER",
          .needs = "--gdb"}},
        {&CommonOptions::wait,
         {.names = "--wait",
          .value = "TIME",
          .help = "Try for so long (30s, 500ms) to reach a target behind --gdb that doesn't answer "
                  "yet",
          .needs = "--gdb"}},
        {&CommonOptions::expect,
         {"--expect", "CLASS[,flash=SIZE]",
          "Refuse any other device before anything in it is changed", Offers::Classes}},
        {&CommonOptions::board,
         {"--board", "NAME",
          "The board of that name in corvane-flash.toml, which lies in this folder or above it: "
          "its target, what is expected there, and its settings",
          Offers::Boards}},
        {&CommonOptions::settingsFile,
         {"--settings", "FILE",
          "Settings file instead of ~/.config/corvane-flash/settings.toml; kept values go beside "
          "it, for x.toml into x.kept.toml, for x into x.kept",
          Offers::Files}},
        {&CommonOptions::set,
         {"--set", "KEY=TEXT", "Set one of the plug-in's settings for this run; may be repeated",
          Offers::SettingAssignments}},
        {&CommonOptions::plugin,
         {.names = "--plugin",
          .value = "FILE",
          .help = "The plug-in library, instead of the one installed with the tool",
          .offers = Offers::Files,
          .environment = "CORVANE_PLUGIN",
          .isForPlugin = true}},
        {&CommonOptions::trace,
         {.names = "--trace",
          .value = "FILE",
          .help =
              "Write the plug-in's trace lines and all host calls to FILE (- is standard error)",
          .offers = Offers::Files,
          .isForPlugin = true}},
        {&CommonOptions::force, {"--force", "", "Write over files that exist (--trace, read)"}},
        {&CommonOptions::progress,
         {.names = "--progress",
          .value = "MODE",
          .help = "How progress is shown: auto, bar, plain (for logs), none",
          .choices = {"auto", "bar", "plain", "none"}}},
        {&CommonOptions::json,
         {"--json", "", "One JSON object a line on standard output, all else on standard error"}},
        {&CommonOptions::quiet, {"-q,--quiet", "", "Say nothing but results and errors"}},
        {&CommonOptions::verbose,
         {"-v,--verbose", "", "Say more; twice: the plug-in's own verbose messages, too"}},
    };
    return options;
}

const std::vector<OptionRow>& CommonRows() {
    static const std::vector<OptionRow> rows = RowsOf(CommonOptionTable());
    return rows;
}

const std::vector<OptionRow>& AnsweredRows() {
    static const std::vector<OptionRow> rows{
        {"-h,--help", "", "Show the help, or that of the command"},
        {"--version", "", "Show the version"},
        {"--man", "", "Print the man page, for 'man -l -'"},
    };
    return rows;
}

const char* GroupHelp(const std::string& word) {
    return std::string_view(word) == "mac" ? "Read or program the MAC address"
                                           : "Read or program a user register";
}

}  // namespace host
