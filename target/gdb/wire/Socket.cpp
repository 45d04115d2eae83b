// Connecting, listening, and waiting in slices.

#include "target/gdb/wire/Socket.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <future>
#include <thread>
#include <utility>
#include <vector>

#include "base/system/ErrorText.h"

namespace target::gdb {

namespace {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

constexpr milliseconds kBetweenInterruptChecks(100);
constexpr milliseconds kAfterInterrupt(1000);

// A name server may keep its caller waiting for long, and no look-up can be called off. So it runs
// beside, and is left to itself when the wait is over.
base::TcpAddresses LookUpBefore(Deadline deadline, const Address& address,
                                const InterruptCheck& interrupted) {
    base::TcpAddresses number = base::LookUpTcp(address.host, address.port, base::LookUp::Number);
    if (number.error.empty()) return number;
    std::promise<base::TcpAddresses> promise;
    std::future<base::TcpAddresses> list = promise.get_future();
    std::thread([address, promise = std::move(promise)]() mutable {
        promise.set_value(base::LookUpTcp(address.host, address.port, base::LookUp::Name));
    }).detach();
    while (list.wait_for(kBetweenInterruptChecks) != std::future_status::ready) {
        if (Clock::now() >= deadline || (interrupted && interrupted()))
            throw SocketError("the look-up of the host's name took too long");
    }
    return list.get();
}

}  // namespace

Address Address::Parse(const std::string& text) {
    const std::size_t colon = text.rfind(':');
    Address address{"localhost", text};
    if (colon != std::string::npos) {
        address.port = text.substr(colon + 1);
        std::string host = text.substr(0, colon);
        if (host.size() > 2 && host.front() == '[' && host.back() == ']')
            host = host.substr(1, host.size() - 2);
        else if (host.find(':') != std::string::npos)
            address.port.clear();
        if (!host.empty()) address.host = host;
    }
    const bool digits = !address.port.empty() && address.port.size() <= 5 &&
                        std::all_of(address.port.begin(), address.port.end(),
                                    [](char digit) { return digit >= '0' && digit <= '9'; });
    if (!digits || std::stoul(address.port) > 65535)
        throw std::invalid_argument(
            fmt::format("'{}' is no HOST:PORT, :PORT or PORT with a port up to 65535 (an address "
                        "with colons goes into brackets: [::1]:3333)",
                        text));
    return address;
}

std::string Address::Text() const {
    return fmt::format(fmt::runtime(host.find(':') == std::string::npos ? "{}:{}" : "[{}]:{}"),
                       host, port);
}

Socket::Socket(base::TcpSocket socket, InterruptCheck interrupted)
    : socket_(std::move(socket)), interrupted_(std::move(interrupted)) {}

Socket Socket::Connect(const Address& address, Deadline deadline,
                       const InterruptCheck& interrupted) {
    const base::TcpAddresses list = LookUpBefore(deadline, address, interrupted);
    if (!list.error.empty()) throw SocketError(list.error);
    int error = 0;
    for (const base::TcpAddress& each : list.addresses) {
        Socket connection({}, interrupted);
        error = connection.socket_.Connect(each);
        if (error == EINPROGRESS)
            error = connection.Await(base::Ready::ToWrite, deadline)
                        ? connection.socket_.PendingError()
                        : ETIMEDOUT;
        if (error == 0) return connection;
        if (interrupted && interrupted()) break;
    }
    throw SocketError(base::ErrorText(error));
}

Socket Socket::Listen(const Address& address, InterruptCheck interrupted) {
    const base::TcpAddresses list =
        base::LookUpTcp(address.host, address.port, base::LookUp::ToListen);
    if (!list.error.empty()) throw SocketError(list.error);
    Socket listener({}, std::move(interrupted));
    if (const int error = listener.socket_.Listen(list.addresses.front()); error != 0)
        throw SocketError(base::ErrorText(error));
    return listener;
}

Socket Socket::Accept(Deadline deadline) {
    while (Await(base::Ready::ToRead, deadline)) {
        base::TcpSocket client;
        const int error = socket_.Accept(client);
        // Other errors are those of a client that has gone again; the next one may come.
        if (error == EMFILE) throw SocketError(base::ErrorText(error));
        if (error == 0) return {std::move(client), interrupted_};
    }
    return {};
}

std::string Socket::Read(Deadline deadline) {
    std::array<char, 4096> bytes;
    while (Await(base::Ready::ToRead, deadline)) {
        const auto got = socket_.Receive(bytes);
        if (got.bytes != 0) return {bytes.data(), got.bytes};
        if (got.error == 0) throw SocketError("it closed the connection");
        if (got.error != EAGAIN)
            throw SocketError("the connection broke: " + base::ErrorText(got.error));
    }
    return {};
}

void Socket::Write(std::string_view bytes, Deadline deadline) {
    while (!bytes.empty()) {
        const auto put = socket_.Send(bytes);
        bytes.remove_prefix(put.bytes);
        if (put.error != 0 && put.error != EAGAIN)
            throw SocketError("the connection broke: " + base::ErrorText(put.error));
        if (put.error == EAGAIN && !Await(base::Ready::ToWrite, deadline))
            throw SocketError("it takes no more bytes");
    }
}

Deadline Socket::Until(Deadline deadline) const {
    return interrupted_ && interrupted_() ? std::min(deadline, After(kAfterInterrupt)) : deadline;
}

bool Socket::Await(base::Ready ready, Deadline deadline) const {
    const Socket* const self = this;
    return Await({&self, 1}, ready, deadline);
}

void Socket::AwaitAny(std::span<const Socket* const> sockets, Deadline deadline) {
    Await(sockets, base::Ready::ToRead, deadline);
}

// In slices, for a signal may come between the check and the wait.
bool Socket::Await(std::span<const Socket* const> sockets, base::Ready ready, Deadline deadline) {
    std::vector<const base::TcpSocket*> waiting;
    for (const Socket* const each : sockets)
        waiting.push_back(&each->socket_);
    for (;;) {
        deadline = sockets.front()->Until(deadline);
        const auto left = std::chrono::ceil<milliseconds>(deadline - Clock::now());
        const auto slice = std::clamp(left, milliseconds(0), kBetweenInterruptChecks);
        const int error = base::TcpSocket::Await(waiting, ready, slice);
        if (error == 0) return true;
        if (error != EAGAIN) throw SocketError(base::ErrorText(error));
        if (left <= milliseconds(0)) return false;
    }
}

}  // namespace target::gdb
