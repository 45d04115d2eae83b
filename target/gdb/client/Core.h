// Core: whether the target's program runs, and how it is started and stopped.
//
// Three states. What comes from the server at any moment is a stop event; what each call and each
// event does:
//
//                          Stopped       Running                 Live
//   Resume                 -> Running    (never called)          (never called)
//                          or Live
//   TryLive, if it reads   (never)       -> Live                 nothing
//   Stop                   nothing       interrupt, -> Stopped   interrupt, -> Stopped
//   stop, asked for        nothing       -> Stopped              -> Stopped
//   stop, told again       nothing       doubtful                doubtful
//   stop, the program's    nothing       -> Stopped, a crash     -> Stopped, a crash
//
// - Running takes nothing but an interrupt. Live can be asked as it runs.
// - Asked for: an interrupt is out, or the server was tried as the program ran (some stop at any
//   byte), and the signal is one that servers give to such a stop.
// - Told again: the signal of the last stop, or one of an interrupt, where that was sent before the
//   last stop; once for each stop. It may also be the program's own. So it is kept as doubtful, and
//   the next interrupt decides: the one that is answered stops a running program; where no answer
//   comes, the program had stopped by itself.
// - A crash is kept until Stop or RequireRunning throws it, as StoppedByItself. Nothing is running
//   then.
// - Events that arrived are taken in before each Resume and after each reset. The core is Stopped
//   then, and they mean nothing.

#pragma once

#include <chrono>
#include <cstdint>
#include <optional>
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
    enum class State { Stopped, Running, Live };

    /// Takes all stop events of the connection from now on.
    explicit Core(Connection& connection);
    Core(const Core&) = delete;
    Core& operator=(const Core&) = delete;

    /// Asks for the state and stops a target that runs. ProtocolError when there is none.
    void Attach();

    /// Lets the stopped program go on.
    void Resume();

    /// Stops the program if it runs. StoppedByItself when it wasn't this that stopped it.
    void Stop();

    /// To be called after a reset, which has stopped the program: what is told of stops before it
    /// is taken in.
    void ForgetStops();

    /// StoppedByItself when the program has come to an end unasked. Doesn't stop it; of a stop that
    /// is told again it may make sure, which stops it for a moment.
    void RequireRunning();

    /// Lets the stopped program go on, and tries whether it can be asked as it runs, by reading the
    /// word at that address; in non-stop mode, where the server has one. Afterwards the program
    /// runs, Live if it can.
    void TryLive(std::uint32_t address, bool nonStopOffered);

    /// Whoever knows a way to ask the running target says so: from now on it runs Live.
    void AssumeLive() { live_ = true; }

    State Now() const { return state_; }
    bool IsStopped() const { return state_ == State::Stopped; }

    /// Whether a program that runs, or will, can be asked as it does.
    bool RunsLive() const { return live_; }

    /// How long it has run so far, not counting when it was stopped.
    std::chrono::nanoseconds RanFor() const;

  private:
    using Clock = std::chrono::steady_clock;

    void Take(const StopReply& stop);
    bool MayBeAnswer(const StopReply& stop) const;
    bool IsEcho(const StopReply& stop) const;
    bool RunsUninterrupted() const { return state_ != State::Stopped && !interruptOut_; }
    void Enter(State state);
    void Interrupt();
    bool AwaitStopped(Wait& wait);
    void SendResume();
    void RefusePacket(const std::string& request);
    void ThrowCrash();
    void DrainNotifications();
    bool TryNonStop(std::uint32_t address);
    void TryAllStop(std::uint32_t address);
    bool ReadsAsItRuns(std::uint32_t address);
    void CatchUp();

    Connection& connection_;
    State state_ = State::Stopped;
    bool live_ = false;
    bool nonStop_ = false;
    std::string continue_;  ///< the request to go on; empty until it was asked for

    bool interruptOut_ = false;  ///< and no stop told since
    bool trying_ = false;   ///< a server of which nobody knows what it does as the program runs
    bool readOut_ = false;  ///< the read of a trial, whose answer may still come

    std::optional<unsigned> usual_;      ///< the signal that answered an interrupt last
    std::optional<unsigned> last_;       ///< the signal of the last stop that counted
    bool interruptedLast_ = false;       ///< that stop came by an interrupt
    bool echoTaken_ = false;             ///< it was told again
    std::optional<StopReply> doubtful_;  ///< an echo, or the program's own stop
    std::optional<StopReply> crash_;     ///< not thrown yet
    bool notified_ = false;              ///< by a notification that wants to be answered

    Clock::time_point since_;  ///< the last Resume
    std::chrono::nanoseconds ran_{0};
};

}  // namespace target::gdb
