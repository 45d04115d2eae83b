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
    Classes,
    Boards,
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
    const char* environment = "";  ///< the variable that stands in for it
    std::vector<std::string> contraries =
        {};                    ///< options that, given by a stronger one, silence it
    const char* needs = "";    ///< without this one it means nothing, unless typed
    bool isForPlugin = false;  ///< it means nothing where no plug-in is loaded
    bool isSwitch = true;      ///< it takes no value
    bool isRepeated = false;   ///< it may be there again, and adds to what was

    bool IsArgument() const { return names[0] != '-'; }

    /// {"-q", "--quiet"}
    std::vector<std::string> Names() const;

    /// "--quiet"; of an argument, its name.
    std::string LongName() const { return Names().back(); }
};

/// Who has given an option, the strongest first. A board stands where it is named: above the
/// environment in the command line, below it in the project file.
enum class GivenBy { Line, Environment, Board };

/// An option or argument that is given.
struct GivenOption {
    const OptionRow* row;
    /// Of an argument, the word itself. Of a switch, empty, or "=TEXT" where it was given a value,
    /// which is a mistake in the line.
    std::string value;
    GivenBy by = GivenBy::Line;
};
using GivenOptions = std::vector<GivenOption>;

}  // namespace host
