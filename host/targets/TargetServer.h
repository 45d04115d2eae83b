// The simulated device of a command line, served to GDB and whatever else speaks its protocol.

#pragma once

#include <cstdint>
#include <functional>
#include <string>

#include "host/targets/SimulatedTarget.h"
#include "target/gdb/server/Server.h"
#include "target/simulated/ServedSimulation.h"

namespace host {

class TargetServer {
  public:
    using Complaint = std::function<void(const std::string& text)>;

    /// Listens at "[HOST:]PORT". Failure (WrongUsage) or Failure (Unreachable). `complain` is told
    /// what the device refuses, and that its contents can't be kept.
    TargetServer(const TargetOptions& options, const std::string& address,
                 const Complaint& complain, const WaitNotice& say);

    /// Where clients connect, with the port that was got.
    const target::gdb::Address& Where() const { return address_; }
    std::string Device() const { return target_.Name(); }
    std::uint16_t Port() const { return server_.Port(); }

    /// Serves until Ctrl-C. Failure (BadFile) when the contents couldn't be kept at the end.
    void Run();

  private:
    SimulatedTarget target_;
    target::gdb::Address address_;
    target::ServedSimulation served_;
    target::gdb::Server server_;
    bool kept_ = true;  ///< what the device held when the last client went
};

}  // namespace host
