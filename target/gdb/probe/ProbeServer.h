// ProbeServer: a probe's GDB server with flash added, for one debugger at a time.

#pragma once

#include <cstdint>
#include <functional>
#include <memory>

#include "target/gdb/probe/ProbeSession.h"
#include "target/gdb/server/Reception.h"
#include "target/gdb/server/Session.h"
#include "target/gdb/wire/Socket.h"

namespace target::gdb {

/// Connects to the probe's server, and asks it for nothing. TargetError.
using ConnectProbe = std::function<std::unique_ptr<GdbTarget>()>;

class ProbeServer {
  public:
    /// Listens at once; port 0 takes a free one. SocketError.
    ProbeServer(ConnectProbe connect, OpenFlash open, const Address& address,
                InterruptCheck interrupted, ComplaintSink complain);

    std::uint16_t Port() const { return reception_.Port(); }

    /// Serves one debugger after the other until the interrupt check says so. The probe is
    /// connected as long as there is one.
    void Run();

  private:
    void Serve(ClientPort& client);
    void Relay(ClientPort& client, GdbTarget& probe, ProbeSession& session);

    const ConnectProbe connect_;
    const OpenFlash open_;
    const InterruptCheck interrupted_;
    const ComplaintSink complain_;
    Reception reception_;
};

}  // namespace target::gdb
