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

bool SetServer(GdbOptions& options, string_view text) {
    options.server = FindProfile(text);
    return options.server != nullptr;
}

bool SetWrites(GdbOptions& options, string_view text) {
    options.binaryWrites = text == "binary";
    return text == "binary" || text == "hex";
}

bool SetReads(GdbOptions& options, string_view text) {
    options.readsTrusted = text == "trusted";
    return text == "trusted" || text == "checked";
}

bool SetLive(GdbOptions& options, string_view text) {
    using Live = GdbOptions::Live;
    options.live = text == "no" ? Live::No : text == "auto" ? Live::Auto : Live::Yes;
    options.liveServer.reset();
    if (text == "auto" || text == "no" || text == "yes") return true;
    try {
        options.liveServer = Address::Parse(std::string(text));
        return true;
    } catch (const std::invalid_argument&) {
        return false;
    }
}

/// A command, or one of the packets that reset a target.
bool SetReset(GdbOptions& options, string_view text) {
    options.reset = text;
    return !text.empty() &&
           (!text.starts_with("packet:") || text == "packet:R" || text == "packet:vRun");
}

const GdbOptionRow kOptionRows[] = {
    {"server", "generic, openocd, jlink, pyocd, blackmagic, qemu or corvane",
     "which server it is, where it doesn't tell by itself; sets what fits it", false, SetServer},
    {"init", "a command", "monitor command to send after connecting; may be repeated", true,
     [](GdbOptions& o, string_view t) {
         o.init.emplace_back(t);
         return !t.empty();
     }},
    {"attach", "a number", "target to attach to after that (vAttach)", false,
     SetNumber<&GdbOptions::attach>},
    {"reset", "a command, packet:vRun or packet:R",
     "monitor command or packet that resets the target and leaves it halted; default: as the "
     "server's profile says, or reset halt",
     true, SetReset},
    {"writes", "binary or hex",
     "how memory is written: X is shorter, M is told of failures by every server; default: as the "
     "server's profile says, or hex",
     false, SetWrites},
    {"reads", "trusted or checked",
     "whether a server is used that answers reads that fail as if they were done; default: checked",
     false, SetReads},
    {"live", "auto, yes, no or HOST:PORT",
     "whether the running target is asked without stopping it, perhaps through a second server; "
     "default: auto, which finds out",
     false, SetLive},
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
