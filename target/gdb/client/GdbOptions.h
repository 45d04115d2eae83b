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

#include "target/gdb/client/Profiles.h"
#include "target/gdb/wire/Socket.h"

namespace target::gdb {

/// What is known of the devices that may stand behind a server, whoever it is. Nothing of it is for
/// users to say, and all of it may be missing.
struct DeviceFacts {
    std::optional<std::uint32_t> ramStart;
    std::optional<std::uint32_t> nothingAt;  ///< an address that no bus access finds anything at

    /// A register that tells whether the core is halted, where the bits of `debugged` are set.
    struct HaltStatus {
        std::uint32_t address;
        std::uint32_t debugged;
        std::uint32_t halted;
    };
    std::optional<HaltStatus> haltStatus;
};

struct GdbOptions {
    /// Whether the running target is asked without being stopped.
    enum class Live { Auto, Yes, No };

    const Profile* server = nullptr;  ///< null: as its answers tell
    std::optional<std::uint32_t> pc;  ///< register numbers, where the server doesn't tell them
    std::optional<std::uint32_t> sp;
    std::optional<std::uint32_t> ramEnd;  ///< the address behind the RAM: where the stack begins
    std::optional<std::uint32_t> attach;  ///< the target to attach to, where a server asks for it
    std::vector<std::string> init;        ///< monitor commands after connecting
    std::optional<std::string> reset;     ///< in place of the profile's
    std::optional<bool> binaryWrites;     ///< the same
    bool readsTrusted = false;            ///< the server may hide that a read has failed
    Live live = Live::Auto;
    std::optional<Address> liveServer;        ///< through which the running target can be asked
    std::chrono::milliseconds timeout{5000};  ///< for each reply
    bool detach = false;  ///< leave with "D", not just by closing the connection
    std::string loader;   ///< the file to load, in place of the one that LoadProgram names
    DeviceFacts device;
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
