// GdbOptions: how a GDB server and the target behind it are to be dealt with, and the option texts
// that users write for it. One table serves parser, help and completion.

#pragma once

#include <chrono>
#include <cstdint>
#include <optional>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace target::gdb {

struct GdbOptions {
    std::optional<std::uint32_t> pc;  ///< register numbers, where the server doesn't tell them
    std::optional<std::uint32_t> sp;
    std::optional<std::uint32_t> ramEnd;  ///< the address behind the RAM: where the stack begins
    std::optional<std::uint32_t> attach;  ///< the target to attach to, where a server asks for it
    std::vector<std::string> init;        ///< monitor commands after connecting
    std::string reset = "reset halt";     ///< the monitor command that resets and leaves halted
    std::chrono::milliseconds timeout{5000};  ///< for each reply
    bool detach = false;  ///< leave with "D", not just by closing the connection
    std::string loader;   ///< the file to load, in place of the one that LoadProgram names
};

/// One line: which option, and what is accepted.
class GdbOptionError : public std::invalid_argument {
  public:
    using std::invalid_argument::invalid_argument;
};

struct GdbOptionRow {
    const char* name;
    const char* accepts;
    const char* meaning;
    bool isText;  ///< takes all that follows, commas included
    bool (*set)(GdbOptions& options, std::string_view text);
};

std::span<const GdbOptionRow> GdbOptionTable();

/// Takes "NAME=VALUE[,NAME=VALUE...]" in. Throws GdbOptionError.
void ParseGdbOption(const std::string& text, GdbOptions& options);

}  // namespace target::gdb
