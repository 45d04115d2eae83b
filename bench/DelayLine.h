// DelayLine: a TCP connection whose requests arrive a fixed time after they were sent, as through a
// slow probe. What the server sends back is handed on at once.

#pragma once

#include <atomic>
#include <chrono>
#include <thread>

#include "target/gdb/wire/Socket.h"

namespace bench {

class DelayLine {
  public:
    /// Waits for one client, which it connects to the server.
    DelayLine(const target::gdb::Address& server, std::chrono::nanoseconds delay);
    ~DelayLine();
    DelayLine(const DelayLine&) = delete;
    DelayLine& operator=(const DelayLine&) = delete;

    /// Where the client connects.
    target::gdb::Address Where() const;

  private:
    void Run();
    void HandOnRequests(target::gdb::Socket& client, target::gdb::Socket& server);
    void HandOnReplies(target::gdb::Socket& server, target::gdb::Socket& client);

    const target::gdb::Address server_;
    const std::chrono::nanoseconds delay_;
    std::atomic<bool> done_ = false;
    target::gdb::Socket listener_;
    std::thread thread_;
};

}  // namespace bench
