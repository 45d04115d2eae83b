// Opening the device and the port.

#include "host/targets/TargetServer.h"

#include "host/base/Errors.h"
#include "host/base/Interrupt.h"
#include "host/targets/Listening.h"

namespace host {

namespace {

namespace gdb = target::gdb;

gdb::Server Listen(target::ServedSimulation& device, const gdb::Address& address,
                   const TargetServer::Complaint& complain) try {
    return {device, address, Interrupted, complain};
} catch (const gdb::SocketError& error) {
    FailToListen(address, error);
}

}  // namespace

TargetServer::TargetServer(const TargetOptions& options, const std::string& address,
                           const Complaint& complain, const WaitNotice& say)
    : target_(options, say),
      address_(ListenAddress(address)),
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

void TargetServer::Run() {
    server_.Run();
    if (!kept_) target_.Keep(true);
}

}  // namespace host
