// Each topic's text, made from the tables.

#include "host/cli/Topics.h"

#include <fmt/format.h>

#include <sstream>
#include <string_view>

#include "host/base/Errors.h"
#include "host/cli/CommandTable.h"
#include "host/cli/Layout.h"
#include "target/gdb/client/GdbOptions.h"
#include "target/simulated/options/DeviceOptions.h"

namespace host {

namespace {

std::string DevicesHelp() {
    std::string names;
    for (const std::string& name : target::DeviceOptionNames())
        names += " " + name;
    return "A simulated device stands in for a board: --sim says which one, and --sim-file\n"
           "keeps its contents in a file, so that the next command finds them.\n\n"
           "  corvane-flash --sim quen,flash=256K --sim-file board.sim program app.hex\n"
           "  corvane-flash --sim tolva,loader=hangs program app.hex\n\n"
           "Classes, with what they have where no option says otherwise:\n" +
           target::DeviceClassesHelp() + "\n" + Wrap("Options:" + names) +
           "'help sim-options' explains them.\n";
}

/// Lines of a name and a text, wrapped like the rest.
std::string DeviceOptionsTopic() {
    std::istringstream lines(target::DeviceOptionsHelp());
    std::string text = "What can be said of a simulated device, as in --sim quen,flash=256K:\n";
    for (std::string line; std::getline(lines, line);) {
        const std::size_t name = line.find_first_not_of(' ');
        const std::size_t blanks = line.find("  ", name);
        text += Entry(line.substr(name, blanks - name),
                      std::string_view(line).substr(line.find_first_not_of(' ', blanks)), 18);
    }
    return text;
}

std::string GdbHelp() {
    std::string text =
        "A board behind a debug probe is reached through the probe's GDB server. While the flash\n"
        "loader runs, most servers must stop it for each look; how it is dealt with otherwise is\n"
        "told by --gdb-option. docs/boards.md has the options for common servers.\n\n"
        "Examples:\n"
        "  corvane-flash --gdb :3333 --loader FlashLoaderMerrow.out program app.elf --run\n"
        "  corvane-flash --gdb :1234 --gdb-option pc=15,sp=13 --gdb-option reset=system_reset "
        "info\n"
        "\nOptions:\n";
    for (const target::gdb::GdbOptionRow& row : target::gdb::GdbOptionTable())
        text += Entry(row.name, fmt::format("{} ({})", row.meaning, row.accepts));
    return text;
}

std::string ProjectHelp() {
    return "A project's boards have names in its file, corvane-flash.toml, which is found in the\n"
           "working folder or the nearest one above it:\n\n"
           "  default = \"bench\"            # for whoever names no target\n\n"
           "  [settings]                   # for all boards; KEY = \"TEXT\"\n"
           "  FlashTimeoutValue = \"5\"\n\n"
           "  [board.bench]                # --board bench\n"
           "  gdb = \":3333\"\n"
           "  server = \"openocd\"\n"
           "  loader = \"FlashLoaderMerrow.out\"\n"
           "  expect = \"quen,flash=512K\"\n\n"
           "  [board.bench.settings]       # above those for all\n"
           "  FlashCrystalFreq = \"10\"\n\n" +
           Wrap(
               "A board may have gdb or sim, loader (from the file's own folder), expect, wait, "
               "and "
               "of the options for a GDB server: server, attach, writes, reads, live, pc, sp, "
               "ram-end, timeout, detach. What would be run on this machine, or written, can't "
               "stand there.") +
           "\n" +
           Wrap(
               "What is typed comes first, a board that is typed among it; then the environment, "
               "the project's default board and its settings, and your own settings. 'settings' "
               "shows where each value comes from.");
}

std::string OptionsHelp() {
    std::string text = "Every command takes these options, before or behind its own:\n";
    for (const OptionRow& row : CommonRows())
        text += OptionEntry(row);
    for (const OptionRow& row : AnsweredRows())
        text += OptionEntry(row);
    return text + "\n" +
           Wrap(
               "Addresses are hexadecimal, with or without 0x; ranges include both ends. What "
               "stands behind -- is no option.");
}

std::string StatusHelp() {
    std::string text = "How a command ended is told by its exit status:\n";
    for (const auto& [status, meaning] : kExitStatuses)
        text += Entry(std::to_string(static_cast<int>(status)), meaning, 8);
    return text;
}

const Topic kTopics[] = {
    {"sim", "Simulated devices: classes", DevicesHelp},
    {"sim-options", "Simulated devices: options, faults", DeviceOptionsTopic},
    {"gdb", "Boards behind a GDB server", GdbHelp},
    {"project", "The project file and its boards", ProjectHelp},
    {"options", "The options that every command takes", OptionsHelp},
    {"status", "Exit statuses", StatusHelp},
};

}  // namespace

std::span<const Topic> Topics() {
    return kTopics;
}

}  // namespace host
