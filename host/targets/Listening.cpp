// Reading the address.

#include "host/targets/Listening.h"

#include <fmt/format.h>

#include "host/base/Errors.h"

namespace host {

// A name may stand for several addresses, and a server listens at one.
target::gdb::Address ListenAddress(const std::string& text) try {
    target::gdb::Address address = target::gdb::Address::Parse(text);
    if (address.host == "localhost") address.host = "127.0.0.1";
    return address;
} catch (const std::invalid_argument& error) {
    throw Failure(ExitStatus::WrongUsage, error.what());
}

void FailToListen(const target::gdb::Address& address, const target::gdb::SocketError& error) {
    throw Failure(ExitStatus::Unreachable,
                  fmt::format("can't listen at {}: {}; try another address or port", address.Text(),
                              error.what()));
}

}  // namespace host
