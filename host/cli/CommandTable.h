// The commands and their options as tables. The parser, the help, the man page and the shell
// completions are all made from them, so that none can drift from the others.

#pragma once

#include <functional>
#include <string>
#include <vector>

#include "host/cli/CommonOptions.h"
#include "host/cli/Option.h"
#include "host/cli/OptionRow.h"

namespace host {

struct Context;
struct Outcome;

/// What a command works with, beside the line itself: options and variables for anything else are
/// not for it.
enum class Needs {
    Nothing,
    Settings,
    ServedTarget,  ///< simulated, or behind a GDB server that was typed
    Device,
};

struct CommandRow {
    const char* name;  ///< "erase", or two words: "mac read"
    const char* help = "";
    const char* details = "";  ///< more sentences for the command's own help
    const char* example = "";  ///< one or more command lines
    std::vector<OptionRow> options = {};
    std::function<Outcome(Context&, const GivenOptions&)> run = {};
    Needs needs = Needs::Device;
};

/// All commands, in the order in which the help lists them.
using CommandRows = std::vector<CommandRow>;

/// The options that every command takes.
const std::vector<Option<CommonOptions>>& CommonOptionTable();
const std::vector<OptionRow>& CommonRows();

/// The options that are answered in the place of a command: --help and the like. They set nothing.
const std::vector<OptionRow>& AnsweredRows();

/// What a first word stands for that has commands below it: "mac".
const char* GroupHelp(const std::string& word);

}  // namespace host
