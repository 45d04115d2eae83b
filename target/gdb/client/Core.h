// Core: whether the target's program runs, and how it is started and stopped. In all-stop mode a
// running target takes nothing but an interrupt; in non-stop mode it can be asked while it runs.

#pragma once

#include <cstdint>
#include <string>

#include "target/gdb/client/Connection.h"
#include "target/gdb/wire/Replies.h"

namespace target::gdb {

/// The program stopped without having been told to: it has crashed, or hit a breakpoint.
class StoppedByItself : public ProtocolError {
  public:
    using ProtocolError::ProtocolError;
};

class Core {
  public:
    explicit Core(Connection& connection) : connection_(connection) {}

    /// Asks for the state and stops a target that runs. ProtocolError when there is none.
    void Attach();

    /// Lets the stopped program go on.
    void Resume();

    /// Stops the program if it runs. StoppedByItself when it wasn't this that stopped it.
    void Stop();

    bool IsRunning() const { return running_; }

    /// Tries to run the stopped program in a way in which it can be asked while it runs, by reading
    /// the word at that address. If the server can't, the program is stopped again.
    void TryLive(std::uint32_t address);

    /// Whether the memory of a running target can be reached.
    bool IsLive() const { return live_; }

    /// StoppedByItself when a live program has come to an end unasked.
    void RequireRunning();

  private:
    StopReply AwaitStop(std::chrono::milliseconds timeout);
    StopReply StopNonStop();
    void DrainStops();
    bool ReadsWhileRunning(std::uint32_t address);
    [[noreturn]] void FailStopped(const StopReply& reply);

    Connection& connection_;
    bool running_ = false;
    bool asked_ = false;  ///< which kinds of "vCont" there are
    const char* continue_ = "c";
    bool nonStop_ = false;
    bool live_ = false;
    bool lookPending_ = false;  ///< the reply to what was asked as the target ran may still come
};

}  // namespace target::gdb
