// An option or an argument as the parser, the help, the man page and the shells see it.

#pragma once

#include <string>
#include <vector>

namespace host {

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

struct OptionRow {
    const char* names;       ///< "-q,--quiet"; of an argument, its name in the help: "FILE"
    const char* value = "";  ///< the value's name in the help, "" for a switch or an argument
    const char* help = "";
    Offers offers = Offers::Nothing;
    std::vector<std::string> choices = {};
    bool isRequired = false;
    const char* environment = "";              ///< the variable that stands in for it
    std::vector<std::string> contraries = {};  ///< options that, when typed, silence the variable
    bool isSwitch = true;                      ///< it takes no value
    bool isRepeated = false;                   ///< it may be there again, and adds to what was

    bool IsArgument() const { return names[0] != '-'; }

    /// {"-q", "--quiet"}
    std::vector<std::string> Names() const;

    /// "--quiet"; of an argument, its name.
    std::string LongName() const { return Names().back(); }
};

/// An option or argument that stands in a command line.
struct GivenOption {
    const OptionRow* row;
    std::string value;  ///< of an argument, the word itself; of a switch, empty
    bool isFromEnvironment = false;
};
using GivenOptions = std::vector<GivenOption>;

}  // namespace host
