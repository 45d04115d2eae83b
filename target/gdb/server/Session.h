// Session: a client's requests to a device, answered. It sees payloads only, so that it can be
// driven without a connection.
//
// The protocol is all-stop: between a request to go on and the stop that answers it, a client may
// send nothing but an interrupt or the end of the session. Everything else is refused then, and
// changes nothing. The core executes nothing: a step is answered by an interrupt, and a breakpoint
// is never hit. A request that fails leaves the session as it was; the device says why to
// whoever runs the server, because an error reply has no room for a text.

#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "target/gdb/server/Arguments.h"
#include "target/gdb/server/ServedDevice.h"

namespace target::gdb {

/// Receives the text of a request that the device refused.
using ComplaintSink = std::function<void(const std::string& text)>;

class Session {
  public:
    /// The longest payload, as told to clients.
    static constexpr std::size_t kPacketSize = 0x4000;

    Session(ServedDevice& device, ComplaintSink complain)
        : device_(device), complain_(std::move(complain)) {}

    /// The payloads to send in reply, in order; none for what is answered when the target stops.
    std::vector<std::string> Answer(std::string_view payload);

    /// Stops the target. The stop reply, if a client waits for one.
    std::vector<std::string> Interrupt();

    bool AcknowledgesPackets() const { return acknowledges_; }
    bool HasEnded() const { return ended_; }

  private:
    using Replies = std::vector<std::string>;
    struct RequestRow;

    static const RequestRow* FindRow(std::string_view payload);

    // One function for each kind of request. All may throw TargetError.
    Replies Supported(const Arguments& arguments);
    Replies StartNoAckMode(const Arguments& arguments);
    Replies WhyStopped(const Arguments& arguments);
    Replies ReadRegisters(const Arguments& arguments);
    Replies WriteRegisters(const Arguments& arguments);
    Replies ReadRegister(const Arguments& arguments);
    Replies WriteRegister(const Arguments& arguments);
    Replies ReadMemory(const Arguments& arguments);
    Replies WriteMemory(const Arguments& arguments);
    Replies Checksum(const Arguments& arguments);
    Replies Continue(const Arguments& arguments);
    Replies Step(const Arguments& arguments);
    Replies Resume(const Arguments& arguments);
    Replies ReadDocument(const Arguments& arguments);
    Replies EraseFlash(const Arguments& arguments);
    Replies WriteFlash(const Arguments& arguments);
    Replies Monitor(const Arguments& arguments);
    Replies Detach(const Arguments& arguments);
    Replies Kill(const Arguments& arguments);
    template <const char* Reply>
    Replies Always(const Arguments& arguments);

    std::optional<std::string> Control(const std::string& command);
    void GoTo(const Arguments& arguments);
    std::string Refuse(const std::string& why);

    ServedDevice& device_;
    const ComplaintSink complain_;
    bool acknowledges_ = true;
    bool awaitsStop_ = false;     ///< the client has let the target run, and waits for its stop
    bool stepped_ = false;        ///< the last resume was a step
    bool interruptKept_ = false;  ///< it came between two steps, and answers the next resume
    bool ended_ = false;
};

}  // namespace target::gdb
