// TcpSocket: TCP without waiting. Each call ends at once, but for Await, and look-ups of names.

#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "base/system/Ready.h"

namespace base {

/// An address as the system has it.
struct TcpAddress {
    int family;
    std::string bytes;
};

struct TcpAddresses {
    std::vector<TcpAddress> addresses;  ///< one at least, without an error
    std::string error;                  ///< why there are none
};

enum class LookUp {
    Number,   ///< no name, and so at once
    Name,     ///< may wait for a name server for long
    ToListen  ///< where a server listens
};

TcpAddresses LookUpTcp(const std::string& host, const std::string& port, LookUp how);

class TcpSocket {
  public:
    using Handle = std::intptr_t;

    /// How many bytes went over, or why none did: EAGAIN when none can just now.
    struct Transfer {
        std::size_t bytes = 0;
        int error = 0;
    };

    TcpSocket() = default;
    explicit TcpSocket(Handle handle);  ///< takes it over
    ~TcpSocket() { Close(); }
    TcpSocket(TcpSocket&& other) noexcept : handle_(std::exchange(other.handle_, kNone)) {}
    TcpSocket& operator=(TcpSocket other) noexcept {
        std::swap(handle_, other.handle_);
        return *this;
    }

    bool IsOpen() const { return handle_ != kNone; }

    /// Opens it and begins a connection. 0, or an error number; EINPROGRESS when it is to be
    /// awaited (ToWrite), after which PendingError tells what became of it.
    int Connect(const TcpAddress& address);
    int PendingError() const;

    /// Opens it and listens. 0, or an error number.
    int Listen(const TcpAddress& address);
    std::uint16_t Port() const;

    /// The next client, which has been awaited (ToRead). 0, or an error number.
    int Accept(TcpSocket& client) const;

    /// No bytes and no error: the other side has closed the connection.
    Transfer Receive(std::span<char> room) const;
    Transfer Send(std::string_view bytes) const;

    /// The other side receives what was sent, and then that there is no more.
    void EndSending() const;

    /// Waits until one of them is ready, or has failed. 0; EAGAIN when none was in time; or another
    /// error number. A signal may end the wait early (EAGAIN).
    static int Await(std::span<const TcpSocket* const> sockets, Ready ready,
                     std::chrono::milliseconds time);

  private:
    static constexpr Handle kNone = -1;

    int Open(int family);
    void Close();

    Handle handle_ = kNone;
};

}  // namespace base
