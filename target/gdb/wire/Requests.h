// Requests: what a client asks, parsed by one function, for the server.

#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace target::gdb {

struct Request {
    enum class Kind {
        Unknown,  ///< or known but malformed; `name` tells which
        Supported,
        StartNoAckMode,
        WhyStopped,
        ReadRegisters,
        WriteRegisters,  ///< data
        ReadRegister,    ///< address: its number
        WriteRegister,   ///< address: its number; data
        ReadMemory,      ///< address, length
        WriteMemory,     ///< address, data
        Continue,        ///< hasAddress: from there
        Step,            ///< hasAddress: from there
        ResumeKinds,     ///< which of them there are
        Checksum,        ///< address, length
        ReadDocument,    ///< name: "features:target.xml"; address: offset; length
        EraseFlash,      ///< address, length
        WriteFlash,      ///< address, data
        FinishFlash,
        Monitor,  ///< data: the command
        FirstThreads,
        MoreThreads,
        CurrentThread,
        ChooseThread,
        ThreadAlive,
        Attached,
        Symbols,
        Detach,
        Kill,
    };

    Kind kind = Kind::Unknown;
    std::uint32_t address = 0;
    std::uint32_t length = 0;
    bool hasAddress = false;
    bool malformed = false;  ///< Unknown only for its arguments
    std::string name = {};
    std::string data = {};  ///< as bytes
};

/// Any payload makes a request; addresses and lengths fit 32 bits, and the data has the length that
/// was announced.
Request ParseRequest(std::string_view payload);

}  // namespace target::gdb
