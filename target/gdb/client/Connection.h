// Connection: one request, one reply, in step with a server that may garble, delay or say too much.
// Once it is out of step (no reply in time, a second garbled one, one that can't be the answer) it
// is lost for good: a reply that comes late must not be taken for the answer to something else.

#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>

#include "target/gdb/wire/Frame.h"
#include "target/gdb/wire/Socket.h"

namespace target::gdb {

/// What went wrong, as a sentence whose subject is the server: "sent no reply to "?" within 5 s".
class ProtocolError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// Receives every packet as shown in a trace: `direction` is "->" to the server or "<-" from it.
using PacketTrace = std::function<void(const char* direction, const std::string& packet)>;

/// A payload as a line of text: shortened, and whatever isn't printable as "\xNN".
std::string Shown(std::string_view payload);

class Connection {
  public:
    Connection(Socket socket, std::chrono::milliseconds timeout, PacketTrace trace);

    /// Sends a request and returns its reply. Stop replies that come late are skipped, and so is
    /// output; that of a monitor command is its reply.
    std::string Ask(const std::string& request);

    /// The next reply to a request that was sent; the connection is lost when there is none before
    /// the deadline. Here and below, a deadline comes nearer once the user interrupts the work.
    std::string AwaitReply(const std::string& request, Deadline& deadline);

    /// Sends a request that is answered by OK.
    void RequireOk(const std::string& request);

    /// The same, false when the server refuses: by an error, or by nothing at all.
    bool Agrees(const std::string& request);

    /// Throws, for that is no reply to have. One that doesn't even refuse the request answers
    /// something else, and the connection is lost.
    [[noreturn]] void Reject(const std::string& request, const std::string& reply);

    /// Sends a request that is answered when the target stops, if at all.
    void Send(const std::string& request);

    /// Stops a running target: no packet, but the byte 0x03.
    void Interrupt();

    /// Takes in what has arrived, so that it is found without a wait: before a deadline long past.
    void TakeArrived();

    /// The next packet that comes by itself, stop replies included; nothing when there is none
    /// within the time.
    std::optional<std::string> Receive(std::chrono::milliseconds timeout);
    std::optional<std::string> Receive(Deadline& deadline);

    /// The same for a notification of that name, in non-stop mode; without the name.
    std::optional<std::string> ReceiveNotification(const std::string& name, Deadline& deadline);

    /// From now on neither side acknowledges packets.
    void StopAcknowledging() { acknowledged_ = false; }

    /// Refuses all further work, with that reason.
    [[noreturn]] void Lose(const std::string& why);

    bool IsLost() const { return !lost_.empty(); }
    std::chrono::milliseconds Timeout() const { return timeout_; }
    void Close() { socket_.Close(); }

    /// How many packets went to the server, interrupts included.
    std::uint64_t SentCount() const { return sentCount_; }

  private:
    std::optional<Frame> NextFrame(Deadline& deadline);
    bool FeedBefore(Deadline deadline);
    bool AwaitAck(Deadline& deadline);
    void Take(Frame frame);
    void Write(std::string_view bytes);

    Socket socket_;
    const std::chrono::milliseconds timeout_;
    const PacketTrace trace_;
    FrameDecoder decoder_{FrameDecoder::Sender::Server};
    std::optional<std::string> packet_;        ///< received and not asked for yet
    std::optional<std::string> notification_;  ///< the same
    std::string lost_;                         ///< why, if it is
    std::uint64_t sentCount_ = 0;
    bool acknowledged_ = true;
    bool damageSeen_ = false;    ///< since the last request
    bool stopExpected_ = false;  ///< as its answer
};

}  // namespace target::gdb
