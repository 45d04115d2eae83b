// ProbeServer: a simulated device behind a GDB server in a thread of its own, in real time. The
// server answers nobody while the target runs, as most do, or takes memory accesses then.

#pragma once

#include <atomic>
#include <optional>
#include <string>
#include <string_view>
#include <thread>

#include "target/gdb/server/Session.h"
#include "target/gdb/wire/Socket.h"
#include "target/simulated/ServedSimulation.h"

namespace bench {

class ProbeServer {
  public:
    ProbeServer(const std::string& device, bool answersAsItRuns);
    ~ProbeServer();
    ProbeServer(const ProbeServer&) = delete;
    ProbeServer& operator=(const ProbeServer&) = delete;

    /// Where its only client connects.
    target::gdb::Address Where() const;

  private:
    void Serve();
    std::optional<std::string> AnswerAsItRuns(std::string_view payload);

    const bool answersAsItRuns_;
    std::atomic<bool> done_ = false;
    target::SimulatedDevice device_;
    target::ServedSimulation served_;
    target::gdb::Session session_;
    target::gdb::Socket listener_;
    std::thread thread_;
};

}  // namespace bench
