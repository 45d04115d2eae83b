// A probe's GDB server with the flash of the device behind it added, served to debuggers.

#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "host/driver/FlashDevice.h"
#include "host/output/Reporter.h"
#include "host/settings/SettingStore.h"
#include "host/targets/GdbServerTarget.h"
#include "target/gdb/probe/ProbeServer.h"

namespace host {

class ProbeServing {
  public:
    /// Listens at "[HOST:]PORT"; nothing is asked of the probe. Failure (WrongUsage), Failure
    /// (BadFile) for the loader, or Failure (Unreachable).
    ProbeServing(const DeviceOptions& options, const std::string& address,
                 const SettingStore& settings, Reporter& reporter);

    /// What is served, for the user.
    std::string Device() const { return BoardAt(*options_.target.gdb); }

    /// Where debuggers connect, with the port that was got.
    const target::gdb::Address& Where() const { return address_; }
    std::uint16_t Port() const { return server_->Port(); }

    /// Serves until Ctrl-C.
    void Run() { server_->Run(); }

  private:
    std::unique_ptr<target::gdb::FlashProgrammer> OpenFlash(target::gdb::GdbTarget& probe) const;

    const DeviceOptions options_;
    const SettingStore& settings_;
    Reporter& reporter_;
    const ProbeConnector connector_;
    target::gdb::Address address_;
    std::unique_ptr<target::gdb::ProbeServer> server_;
};

}  // namespace host
