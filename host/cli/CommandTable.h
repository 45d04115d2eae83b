// The commands and their options as tables. The parser, the help, the man page and the shell
// completions are all made from them, so that none can drift from the others.

#pragma once

#include <string>
#include <variant>
#include <vector>

#include "host/cli/Options.h"

namespace host {

struct Context;
struct Outcome;

/// What a shell offers to complete a value with, apart from the choices. Other texts than the
/// choices are refused, unless they are `SomeChoices`.
enum class Offers {
    Nothing,
    SomeChoices,
    Files,
    Devices,
    GdbOptions,
    Settings,
    SettingAssignments,
    HelpWords,
};

using OptionMember =
    std::variant<bool Options::*, int Options::*, std::string Options::*,
                 std::optional<std::string> Options::*, std::vector<std::string> Options::*>;

struct OptionRow {
    const char* names;  ///< "-q,--quiet"; of an argument, its name in the help: "FILE"
    const char* value;  ///< the value's name in the help, "" for a switch or an argument
    const char* help;
    OptionMember member;
    Offers offers = Offers::Nothing;
    std::vector<std::string> choices = {};
    bool required = false;
    const char* environment = "";
    std::vector<std::string> overrides = {};  ///< options that, when typed, beat the environment

    bool IsArgument() const { return names[0] != '-'; }
    bool IsRepeated() const {
        return std::holds_alternative<std::vector<std::string> Options::*>(member);
    }
    bool IsSwitch() const {
        return std::holds_alternative<bool Options::*>(member) ||
               std::holds_alternative<int Options::*>(member);
    }
};

struct CommandRow {
    const char* name;  ///< "erase", or two words: "mac read"
    const char* help;
    const char* details;  ///< more sentences for the command's own help, or ""
    const char* example;  ///< one or more command lines
    std::vector<OptionRow> options;
    Outcome (*run)(Context&);
    bool readsSettings = true;
    bool isForSimulated = false;  ///< devices only: a GDB server in the environment isn't meant
};

/// All commands, in the order in which the help lists them.
using CommandRows = std::vector<CommandRow>;

/// The options that every command takes.
const std::vector<OptionRow>& GlobalOptions();

/// The options that are answered in the place of a command: --help and the like. They set nothing.
const std::vector<OptionRow>& AnsweredOptions();

/// What a first word stands for that has commands below it: "mac".
const char* GroupHelp(const std::string& word);

}  // namespace host
