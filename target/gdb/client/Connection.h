// Connection: one request, one reply, in step with a server that may garble, delay or say too much.
//
// What arrives is one of three things. A reply belongs to the one request that is out; a reply
// without a request, or one that can't be its answer, means that the two sides are out of step.
// Output (also an empty "O", by which servers show that they are alive) answers nothing: it only
// extends the wait for the reply. A stop reply that isn't the answer to a request is an event; it
// goes to the stop sink, at whatever moment it arrives.
//
// Once the connection is out of step, or a reply doesn't come in time, it is lost for good: a reply
// that comes late must not be taken for the answer to something else. All further calls then throw
// the same ProtocolError.

#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>

#include "target/gdb/wire/Frame.h"
#include "target/gdb/wire/Replies.h"
#include "target/gdb/wire/Socket.h"

namespace target::gdb {

/// What went wrong, as a sentence whose subject is the server: "sent no reply to "?" within 5 s".
class ProtocolError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// Receives every packet as shown in a trace: `direction` is "->" to the server or "<-" from it.
using PacketTrace = std::function<void(const char* direction, const std::string& packet)>;

/// Receives the stop replies that answer no request. It must not use the connection.
using StopSink = std::function<void(const StopReply& stop)>;

/// A payload as a line of text: shortened, and whatever isn't printable as "\xNN".
std::string Shown(std::string_view payload);

/// How long something that isn't done yet may go on: output moves the deadline, up to the limit.
struct Wait {
    Deadline deadline;
    Deadline limit;
};

/// Receives what the server says, packets and notifications, to pass it on.
using RelaySink = std::function<void(const Frame& frame)>;

class Connection {
  public:
    Connection(Socket socket, std::chrono::milliseconds timeout, PacketTrace trace);

    void SetStopSink(StopSink sink) { stopSink_ = std::move(sink); }

    /// As long as there is a sink, everything that the server says goes there, and Relay is the
    /// only way to send a request. It must not use the connection. An empty one ends that.
    void SetRelay(RelaySink sink) { relay_ = std::move(sink); }

    /// Sends a request whose reply goes to the relay sink.
    void Relay(const std::string& request);

    /// For a wait that includes others.
    const Socket& Wire() const { return socket_; }

    /// Sends a request and returns its reply.
    std::string Ask(const std::string& request);

    /// The same for one that may take longer.
    std::string Ask(const std::string& request, std::chrono::milliseconds time);

    /// Sends a request that is answered by OK.
    void RequireOk(const std::string& request);

    /// The same, false when the server refuses: by an error, or by nothing at all.
    bool Agrees(const std::string& request);

    /// Throws, for that is no reply to have. One that doesn't even refuse the request answers
    /// something else, and the connection is lost.
    [[noreturn]] void Reject(const std::string& request, const std::string& reply);

    /// The output that came with the last request's reply: what a monitor command had to say.
    const std::string& Output() const { return output_; }

    /// Sends a request without waiting for a reply. What arrived before and nobody asked for is
    /// taken in first.
    void Send(const std::string& request);

    /// The reply to the request that was sent last; the connection is lost when there is none
    /// before the deadline. Here and below, a deadline comes nearer once the user interrupts the
    /// work.
    std::string AwaitReply(const std::string& request, Wait& wait);

    /// Stops a running target: no packet, but the byte 0x03.
    void Interrupt();

    /// Takes one frame in; false when none came before the deadline.
    bool Step(Wait& wait);

    /// Takes in what has arrived, without a wait.
    void TakeArrived();

    /// A packet that was taken in and is neither an event nor output.
    std::optional<std::string> TakePacket() { return std::exchange(packet_, std::nullopt); }

    /// A wait for as long as a reply may take, or for so long.
    Wait Patience() const { return Patience(timeout_); }
    Wait Patience(std::chrono::milliseconds time) const;

    /// "within 5 s; --gdb-option timeout=TIME allows it more".
    std::string WithinTimeout() const { return Within(timeout_); }

    /// From now on neither side acknowledges packets.
    void StopAcknowledging() { acknowledged_ = false; }
    bool Acknowledges() const { return acknowledged_; }

    /// Refuses all further work, with that reason.
    [[noreturn]] void Lose(const std::string& why);

    bool IsLost() const { return !lost_.empty(); }
    std::chrono::milliseconds Timeout() const { return timeout_; }

    /// Nothing more is asked. Waits a little for the server to have read what was.
    void Close();

    /// How many packets went to the server, interrupts included.
    std::uint64_t SentCount() const { return sentCount_; }

  private:
    static std::string Within(std::chrono::milliseconds time);
    std::optional<Frame> NextFrame(Deadline& deadline);
    bool FeedBefore(Deadline deadline);
    bool AwaitAck(Wait& wait);
    void RefuseUnasked();
    void Take(Frame frame, Wait& wait);
    void TakePayload(std::string payload, Wait& wait);
    void Deliver(const std::string& request);
    void Extend(Wait& wait) const;
    void Write(std::string_view bytes);

    Socket socket_;
    const std::chrono::milliseconds timeout_;
    const PacketTrace trace_;
    StopSink stopSink_;
    RelaySink relay_;
    FrameDecoder decoder_{FrameDecoder::Sender::Server};
    std::optional<std::string> packet_;  ///< a reply that was taken in and not asked for yet
    std::string lastReply_;              ///< which a server that missed its "+" sends again
    std::string output_;                 ///< since the last request
    std::string lost_;                   ///< why, if it is
    std::uint64_t sentCount_ = 0;
    bool acknowledged_ = true;
    bool damageSeen_ = false;    ///< since the last request
    bool stopExpected_ = false;  ///< as the answer to the request that is out
};

}  // namespace target::gdb
