// Socket: TCP with a limit to every wait. A wait also ends soon after the user has interrupted the
// work: a healthy server's answer still comes through, a silent one keeps nobody.

#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>

#include "base/system/TcpSocket.h"

namespace target::gdb {

using Deadline = std::chrono::steady_clock::time_point;

inline Deadline After(std::chrono::milliseconds time) {
    return std::chrono::steady_clock::now() + time;
}

/// Whether the user has had enough; asked about ten times a second during a wait. Empty: never.
using InterruptCheck = std::function<bool()>;

/// The text says what failed and why, without naming the other side.
class SocketError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// "HOST:PORT"; ":PORT" and "PORT" mean this machine; "[::1]:PORT" for an address with colons.
struct Address {
    std::string host;
    std::string port;

    /// Throws std::invalid_argument with a text that says what is accepted. Port 0 is for servers.
    static Address Parse(const std::string& text);
    std::string Text() const;
};

class Socket {
  public:
    Socket() = default;
    Socket(base::TcpSocket socket, InterruptCheck interrupted);

    /// A connection to the first of the host's addresses that takes one.
    static Socket Connect(const Address& address, Deadline deadline,
                          const InterruptCheck& interrupted);

    /// A listening socket. SocketError when the address can't be had.
    static Socket Listen(const Address& address, InterruptCheck interrupted);

    /// The port that a listening socket got.
    std::uint16_t Port() const { return socket_.Port(); }

    /// The next client; an unconnected socket when none came before the deadline.
    Socket Accept(Deadline deadline);

    /// Waits until one of them has something to be read or accepted; all listen to one interrupt.
    static void AwaitAny(std::span<const Socket* const> sockets, Deadline deadline);

    /// When to end a wait that is made of several: the deadline, or soon if the user has
    /// interrupted the work.
    Deadline Until(Deadline deadline) const;

    bool IsOpen() const { return socket_.IsOpen(); }
    void Close() { socket_ = {}; }

    /// The peer reads what was written, and then that there is no more.
    void EndWriting() const { socket_.EndSending(); }

    /// What has arrived, as soon as anything has; an empty text when nothing came before the
    /// deadline. SocketError when the connection is closed or broken.
    std::string Read(Deadline deadline);

    /// All of the bytes, or SocketError.
    void Write(std::string_view bytes, Deadline deadline);

  private:
    bool Await(base::Ready ready, Deadline deadline) const;
    static bool Await(std::span<const Socket* const> sockets, base::Ready ready, Deadline deadline);

    base::TcpSocket socket_;
    InterruptCheck interrupted_;
};

}  // namespace target::gdb
