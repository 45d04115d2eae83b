// Laying out the tables of commands and options in roff.

#include "host/cli/ManPage.h"

#include <fmt/format.h>

#include <string_view>

#include "host/base/Errors.h"
#include "host/cli/CommandTable.h"
#include "host/cli/Words.h"
#include "target/gdb/client/GdbOptions.h"
#include "target/simulated/options/DeviceOptions.h"

namespace host {

namespace {

/// Text as roff prints it: a hyphen stays a hyphen, and no line is taken for a request.
std::string Roff(std::string_view text) {
    std::string escaped;
    bool lineStarts = true;
    for (const char c : text) {
        if (lineStarts && (c == '.' || c == '\'')) escaped += "\\&";
        if (c == '-') escaped += '\\';
        escaped += c == '\\' ? std::string("\\e") : std::string{c};
        lineStarts = c == '\n';
    }
    return escaped;
}

std::string OptionText(const OptionRow& row) {
    std::string line;
    for (const std::string& name : row.Names())
        line += fmt::format(R"({}\fB{}\fR)", line.empty() ? "" : ", ", Roff(name));
    if (*row.value != '\0') line += fmt::format(R"( \fI{}\fR)", Roff(row.value));
    const std::string environment =
        *row.environment == '\0' ? "" : fmt::format(" Environment: {}.", row.environment);
    return fmt::format(".TP\n{}\n{}.{}\n", line, Roff(row.help), environment);
}

/// "[KEY]..." with nothing but the name set in italics.
std::string Argument(const std::string& word) {
    const std::size_t first = word.find_first_not_of('[');
    const std::size_t end = word.find_first_of("].", first);
    const std::string tail = end == std::string::npos ? "" : word.substr(end);
    return fmt::format(R"({}\fI{}\fR{})", word.substr(0, first),
                       Roff(word.substr(first, end - first)), tail);
}

std::string Synopsis(const CommandRow& command) {
    std::string line = fmt::format(R"(\fBcorvane\-flash {}\fR)", Roff(command.name));
    const std::vector<std::string> words = UsageWords(command);
    for (std::size_t i = 1; i < words.size(); ++i)
        line += " " + Argument(words[i]);
    return line;
}

std::string CommandText(const CommandRow& command) {
    std::string text = fmt::format(".SS {}\n{}.\n", Synopsis(command), Roff(command.help));
    if (*command.details != '\0') text += Roff(command.details) + "\n";
    for (const OptionRow& row : command.options)
        text += OptionText(row);
    return text + fmt::format(".PP\nExample:\n.PP\n.nf\n{}\n.fi\n", Roff(command.example));
}

constexpr char kHead[] =
    ".TH CORVANE\\-FLASH 1 \"\" \"corvane\\-flash " CORVANE_FLASH_VERSION
    "\" \"User Commands\"\n"
    ".SH NAME\ncorvane\\-flash \\- program the flash of Corvane microcontrollers\n"
    ".SH SYNOPSIS\n\\fBcorvane\\-flash\\fR [\\fIOPTION\\fR]... \\fICOMMAND\\fR "
    "[\\fIARGUMENT\\fR]...\n"
    ".SH DESCRIPTION\nPrograms, verifies and erases flash through the flash plug\\-in, which it "
    "loads as a debugger does. Addresses are hexadecimal, with or without 0x; a range A\\-B "
    "includes both ends. Nothing is ever erased whole unless asked for.\n";

constexpr char kTail[] =
    ".SH FILES\n"
    ".TP\n\\fI~/.config/corvane\\-flash/settings.toml\\fR\nYour settings, as lines of the form "
    "KEY = \"TEXT\". The tool only reads them. XDG_CONFIG_HOME is respected.\n"
    ".TP\n\\fI~/.config/corvane\\-flash/settings.kept.toml\\fR\nWhat the tool and the plug\\-in "
    "keep themselves.\n"
    ".SH ENVIRONMENT\n"
    ".TP\nCORVANE_SET_\\fIKEY\\fR\nA setting's value, for example "
    "CORVANE_SET_FlashTimeoutValue.\n"
    ".TP\nNO_COLOR\nWhen set, nothing is coloured.\n";

}  // namespace

std::string ManPage(const CommandRows& commands) {
    std::string page = kHead;
    page += ".SH OPTIONS\nEvery command takes them, before or behind its own.\n";
    for (const OptionRow& row : CommonRows())
        page += OptionText(row);
    page += ".SH COMMANDS\n";
    for (const CommandRow& command : commands)
        page += CommandText(command);
    page += ".SH SIMULATED DEVICES\n.nf\n" +
            Roff(target::DeviceClassesHelp() + "\n" + target::DeviceOptionsHelp()) + "\n.fi\n";
    page +=
        ".SH GDB SERVERS\nWith \\fB\\-\\-gdb\\fR the target is a board behind a GDB server. "
        "\\fB\\-\\-gdb\\-option\\fR takes:\n";
    for (const target::gdb::GdbOptionRow& row : target::gdb::GdbOptionTable())
        page += fmt::format(".TP\n\\fB{}\\fR=\\fIVALUE\\fR\n{} ({}).\n", Roff(row.name),
                            Roff(row.meaning), Roff(row.accepts));
    page += ".SH EXIT STATUS\n";
    for (const auto& [status, meaning] : kExitStatuses)
        page += fmt::format(".TP\n{}\n{}.\n", static_cast<int>(status), Roff(meaning));
    return page + kTail;
}

}  // namespace host
