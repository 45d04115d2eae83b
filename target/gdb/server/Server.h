// Server: a device as a GDB server, for one client at a time.

#pragma once

#include <cstdint>

#include "target/gdb/server/Reception.h"
#include "target/gdb/server/ServedDevice.h"
#include "target/gdb/server/Session.h"
#include "target/gdb/wire/Socket.h"

namespace target::gdb {

class Server {
  public:
    /// Listens at once; port 0 takes a free one. SocketError. `device` must outlive the server.
    Server(ServedDevice& device, const Address& address, InterruptCheck interrupted,
           ComplaintSink complain);

    std::uint16_t Port() const { return reception_.Port(); }

    /// Serves one client after the other until the interrupt check says so.
    void Run();

  private:
    void Serve(Reception::Client arrived);

    ServedDevice& device_;
    const InterruptCheck interrupted_;
    const ComplaintSink complain_;
    Reception reception_;
};

}  // namespace target::gdb
