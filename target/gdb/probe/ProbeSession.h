// ProbeSession: one debugger in front of a probe's GDB server, with flash added.
//
// Whatever isn't in the table of requests passes unchanged, both ways. The session's own requests
// go out only when the probe has answered the debugger's last one and the core is stopped (Settle).
//
//                     Passing                     Borrowed
//   flash is worked   takes the debugger's value, stays
//                     -> Borrowed
//   m, M, X           pass, or go to what is      the same, and to the value
//                     collected of the flash
//   vFlashDone        puts the value back, -> Passing
//   any other packet  passes                      the value is put back first, -> Passing
//
// In Borrowed, the target is the flash loader's, and what the debugger has there is a value. OK is
// the answer to vFlashDone only when the flash was compared and the value is back in place.

#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "target/gdb/client/GdbTarget.h"
#include "target/gdb/probe/FlashProgrammer.h"
#include "target/gdb/probe/SavedTarget.h"
#include "target/gdb/server/Arguments.h"
#include "target/gdb/server/ClientPort.h"
#include "target/gdb/server/Session.h"
#include "target/gdb/wire/Replies.h"

namespace target::gdb {

/// Identifies the device behind the probe. TargetError.
using OpenFlash = std::function<std::unique_ptr<FlashProgrammer>(GdbTarget& probe)>;

class ProbeSession {
  public:
    /// All must outlive the session.
    ProbeSession(ClientPort& client, GdbTarget& probe, const OpenFlash& open,
                 const ComplaintSink& complain);
    ~ProbeSession();
    ProbeSession(const ProbeSession&) = delete;
    ProbeSession& operator=(const ProbeSession&) = delete;

    /// Takes a packet or an interrupt of the debugger's. SocketError when the debugger is gone,
    /// ProtocolError when the probe is.
    void Take(const Frame& frame);

    /// The debugger has asked to leave: the probe may hang up.
    bool IsEnding() const { return ends_; }

    /// The debugger has gone: what it had is put back, and what it began is told.
    void Leave();

  private:
    using Reply = std::optional<std::string>;  ///< nothing: the packet passes
    static constexpr char kDone[] = "OK";
    static constexpr char kFailed[] = "E01";

    struct RequestRow;

    /// For as long as it lives, the probe's replies don't go to the debugger.
    class Own {
      public:
        explicit Own(ProbeSession& session);
        ~Own();
        Own(const Own&) = delete;
        Own& operator=(const Own&) = delete;

      private:
        ProbeSession& session_;
    };

    static const RequestRow* FindRow(std::string_view payload);

    // From the probe.
    void TakeFromProbe(const Frame& frame);
    bool IsUnasked() const;
    void NoteReply(const std::string& reply);
    std::string WithFlash(const std::string& features);

    // To the probe.
    void Pass(const std::string& payload);
    void Settle();
    FlashProgrammer& Flash();
    void Borrow();
    void GiveBack();
    std::string ReadThrough(std::uint32_t address, std::uint32_t size);
    bool TouchesCollected(const Arguments& arguments) const;
    bool TouchesOwn(const Arguments& arguments) const;
    Reply Answer(const std::string& payload);

    // One function for each kind of request that may not pass. All may throw TargetError.
    Reply StartNoAckMode(const Arguments& arguments);
    Reply Refuse(const Arguments& arguments);
    Reply ReadMemoryMap(const Arguments& arguments);
    Reply EraseFlash(const Arguments& arguments);
    Reply WriteFlash(const Arguments& arguments);
    Reply FlashDone(const Arguments& arguments);
    Reply ReadMemory(const Arguments& arguments);
    Reply ReadBinary(const Arguments& arguments);
    Reply WriteMemory(const Arguments& arguments);
    Reply Checksum(const Arguments& arguments);
    Reply Monitor(const Arguments& arguments);

    ClientPort& client_;
    GdbTarget& probe_;
    const OpenFlash& open_;
    const ComplaintSink& complain_;
    const InterruptCheck stop_;
    Features features_;
    DebuggerRequests requests_;
    std::unique_ptr<FlashProgrammer> flash_;
    std::optional<SavedTarget> saved_;  ///< Borrowed
    std::optional<std::string> asked_;  ///< the request that the probe hasn't answered yet
    bool stopped_ = false;              ///< the probe has said so, and wasn't told to go on since
    bool running_ = false;
    bool ends_ = false;  ///< the debugger's last request was to leave
    int ownDepth_ = 0;
    bool acknowledgesInVain_ = false;  ///< the probe offers to do without
};

}  // namespace target::gdb
