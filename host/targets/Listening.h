// Where a server of ours listens, from the command line's text.

#pragma once

#include <string>

#include "target/gdb/wire/Socket.h"

namespace host {

/// "[HOST:]PORT"; without HOST, only this machine can connect. Failure (WrongUsage).
target::gdb::Address ListenAddress(const std::string& text);

/// Throws the Failure (Unreachable) of an address that can't be had.
[[noreturn]] void FailToListen(const target::gdb::Address& address,
                               const target::gdb::SocketError& error);

}  // namespace host
