// Opening the device and the port.

#include "host/targets/TargetServer.h"

#include <fmt/format.h>

#include "host/base/Errors.h"
#include "host/base/Interrupt.h"

namespace host {

namespace {

namespace gdb = target::gdb;

// A name may stand for several addresses, and a server listens at one.
gdb::Address ParseAddress(const std::string& text) try {
    gdb::Address address = gdb::Address::Parse(text);
    if (address.host == "localhost") address.host = "127.0.0.1";
    return address;
} catch (const std::invalid_argument& error) {
    throw Failure(ExitStatus::WrongUsage, error.what());
}

const TargetOptions& RequireSimulated(const TargetOptions& options) {
    if (options.gdb)
        throw Failure(ExitStatus::WrongUsage,
                      "serve serves a simulated device: it takes --sim and --sim-file, not --gdb");
    return options;
}

gdb::Server Listen(target::ServedSimulation& device, const gdb::Address& address,
                   const TargetServer::Complaint& complain) try {
    return {device, address, Interrupted, complain};
} catch (const gdb::SocketError& error) {
    throw Failure(ExitStatus::Unreachable,
                  fmt::format("can't listen at {}: {}; try another address or port", address.Text(),
                              error.what()));
}

}  // namespace

TargetServer::TargetServer(const TargetOptions& options, const std::string& address,
                           const Complaint& complain, const WaitNotice& say)
    : target_(RequireSimulated(options), say),
      address_(ParseAddress(address)),
      served_(target_.Device(), complain,
              [this, complain] {
                  try {
                      kept_ = false;
                      target_.Keep(true);
                      kept_ = true;
                  } catch (const Failure& failure) {
                      complain(failure.what());
                  }
              }),
      server_(Listen(served_, address_, complain)) {
    address_.port = std::to_string(server_.Port());
}

void TargetServer::Run() try {
    server_.Run();
    if (!kept_) target_.Keep(true);
} catch (const Failure& failure) {
    throw Failure(ExitStatus::BadFile, failure.what());
}

}  // namespace host
