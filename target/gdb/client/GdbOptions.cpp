// The table of options and its parser.

#include "target/gdb/client/GdbOptions.h"

#include <fmt/format.h>

#include <algorithm>
#include <charconv>

#include "base/Duration.h"
#include "base/Hex.h"
#include "target/gdb/wire/Fields.h"

namespace target::gdb {

namespace {

using std::string_view;
using Number = std::optional<std::uint32_t> GdbOptions::*;

template <Number Member>
bool SetNumber(GdbOptions& options, string_view text) {
    const char* const end = text.data() + text.size();
    std::uint32_t number = 0;
    const auto [rest, error] = std::from_chars(text.data(), end, number);
    options.*Member = number;
    return error == std::errc() && rest == end;
}

bool SetRamEnd(GdbOptions& options, string_view text) {
    options.ramEnd = base::ParseHex32(text);
    return options.ramEnd.has_value();
}

bool SetTimeout(GdbOptions& options, string_view text) {
    const auto duration = base::ParseDuration(text);
    if (!duration) return false;
    options.timeout = std::chrono::duration_cast<std::chrono::milliseconds>(*duration);
    return options.timeout.count() != 0;
}

bool SetDetach(GdbOptions& options, string_view text) {
    options.detach = text == "yes";
    return text == "yes" || text == "no";
}

const GdbOptionRow kOptionRows[] = {
    {"init", "a command", "monitor command to send after connecting; may be repeated", true,
     [](GdbOptions& o, string_view t) {
         o.init.emplace_back(t);
         return !t.empty();
     }},
    {"attach", "a number", "target to attach to after that (vAttach)", false,
     SetNumber<&GdbOptions::attach>},
    {"reset", "a command",
     "monitor command that resets the target and leaves it halted; default: reset halt", true,
     [](GdbOptions& o, string_view t) {
         o.reset = t;
         return !t.empty();
     }},
    {"pc", "a number", "number of the program counter, where the server doesn't tell", false,
     SetNumber<&GdbOptions::pc>},
    {"sp", "a number", "number of the stack pointer, where the server doesn't tell", false,
     SetNumber<&GdbOptions::sp>},
    {"ram-end", "a hexadecimal address", "address behind the RAM; default: as the device says",
     false, SetRamEnd},
    {"timeout", "a whole number with ms or s, up to an hour",
     "how long a reply may take; default: 5s", false, SetTimeout},
    {"detach", "yes or no",
     "leave with D, not just by closing the connection, which leaves most targets halted", false,
     SetDetach},
};

const GdbOptionRow& FindRow(string_view name) {
    for (const GdbOptionRow& row : kOptionRows)
        if (name == row.name) return row;
    std::string names;
    for (const GdbOptionRow& row : kOptionRows)
        names += fmt::format("{}{}", names.empty() ? "" : ", ", row.name);
    throw GdbOptionError(fmt::format("there is no option '{}'; there are: {}", name, names));
}

}  // namespace

std::span<const GdbOptionRow> GdbOptionTable() {
    return kOptionRows;
}

void ParseGdbOption(const std::string& text, GdbOptions& options) {
    string_view rest = text;
    do {
        const GdbOptionRow& row = FindRow(rest.substr(0, rest.find('=')));
        rest.remove_prefix(std::min(rest.size(), string_view(row.name).size() + 1));
        const string_view value = row.isText ? rest : TakeUntil(rest, ',');
        if (row.isText) rest = {};
        if (!row.set(options, value))
            throw GdbOptionError(
                fmt::format("{} takes {}, not '{}'", row.name, row.accepts, value));
    } while (!rest.empty());
}

}  // namespace target::gdb
