// Sockets of the C library.

#include "base/system/TcpSocket.h"

#include <fcntl.h>
#include <netdb.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <memory>

namespace base {

namespace {

int SocketOf(TcpSocket::Handle handle) {
    return static_cast<int>(handle);
}

const sockaddr* Name(const TcpAddress& address) {
    return reinterpret_cast<const sockaddr*>(address.bytes.data());
}

socklen_t NameSize(const TcpAddress& address) {
    return static_cast<socklen_t>(address.bytes.size());
}

int ErrorOf(int result) {
    return result < 0 ? errno : 0;
}

void SetOption(int socket, int level, int name, int value) {
    // What can't be set is only less comfortable.
    setsockopt(socket, level, name, &value, sizeof value);
}

// A request is a packet of its own and must not wait for more. A peer that vanished without a word
// is noticed after a minute.
void SetUpConnection(int socket) {
    SetOption(socket, IPPROTO_TCP, TCP_NODELAY, 1);
    SetOption(socket, SOL_SOCKET, SO_KEEPALIVE, 1);
    SetOption(socket, IPPROTO_TCP, TCP_KEEPIDLE, 30);
    SetOption(socket, IPPROTO_TCP, TCP_KEEPINTVL, 10);
    SetOption(socket, IPPROTO_TCP, TCP_KEEPCNT, 3);
}

TcpSocket::Transfer TransferOf(ssize_t bytes) {
    if (bytes >= 0) return {static_cast<std::size_t>(bytes), 0};
    return {0, errno == EINTR ? EAGAIN : errno};
}

}  // namespace

TcpAddresses LookUpTcp(const std::string& host, const std::string& port, LookUp how) {
    addrinfo hints{};
    hints.ai_socktype = SOCK_STREAM;
    hints.ai_flags = how == LookUp::Number     ? AI_NUMERICHOST
                     : how == LookUp::ToListen ? AI_PASSIVE
                                               : 0;
    addrinfo* found = nullptr;
    const int error = getaddrinfo(host.c_str(), port.c_str(), &hints, &found);
    const std::unique_ptr<addrinfo, void (*)(addrinfo*)> list(found, freeaddrinfo);
    if (error != 0) return {{}, gai_strerror(error)};
    TcpAddresses addresses;
    for (const addrinfo* each = found; each != nullptr; each = each->ai_next)
        addresses.addresses.push_back(
            {each->ai_family,
             std::string(reinterpret_cast<const char*>(each->ai_addr), each->ai_addrlen)});
    return addresses;
}

TcpSocket::TcpSocket(Handle handle) : handle_(handle) {
    fcntl(SocketOf(handle_), F_SETFL, fcntl(SocketOf(handle_), F_GETFL) | O_NONBLOCK);
}

void TcpSocket::Close() {
    if (IsOpen()) close(SocketOf(handle_));
}

int TcpSocket::Open(int family) {
    const int opened = socket(family, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
    if (opened < 0) return errno;
    *this = TcpSocket(opened);
    return 0;
}

int TcpSocket::Connect(const TcpAddress& address) {
    if (const int error = Open(address.family); error != 0) return error;
    SetUpConnection(SocketOf(handle_));
    const int error = ErrorOf(connect(SocketOf(handle_), Name(address), NameSize(address)));
    // An interrupted connect goes on by itself, like one that can't be had at once.
    return error == EINTR ? EINPROGRESS : error;
}

int TcpSocket::PendingError() const {
    int error = 0;
    socklen_t size = sizeof error;
    getsockopt(SocketOf(handle_), SOL_SOCKET, SO_ERROR, &error, &size);
    return error;
}

int TcpSocket::Listen(const TcpAddress& address) {
    if (const int error = Open(address.family); error != 0) return error;
    // The port is free again as soon as its last server has ended.
    SetOption(SocketOf(handle_), SOL_SOCKET, SO_REUSEADDR, 1);
    const int error = ErrorOf(bind(SocketOf(handle_), Name(address), NameSize(address)));
    return error != 0 ? error : ErrorOf(listen(SocketOf(handle_), 4));
}

std::uint16_t TcpSocket::Port() const {
    sockaddr_storage name{};
    socklen_t size = sizeof name;
    getsockname(SocketOf(handle_), reinterpret_cast<sockaddr*>(&name), &size);
    std::array<char, 8> port{};
    getnameinfo(reinterpret_cast<sockaddr*>(&name), size, nullptr, 0, port.data(), port.size(),
                NI_NUMERICSERV);
    return static_cast<std::uint16_t>(std::stoul(port.data()));
}

int TcpSocket::Accept(TcpSocket& client) const {
    const int accepted = accept4(SocketOf(handle_), nullptr, nullptr, SOCK_CLOEXEC);
    if (accepted < 0) return errno;
    SetUpConnection(accepted);
    client = TcpSocket(accepted);
    return 0;
}

TcpSocket::Transfer TcpSocket::Receive(std::span<char> room) const {
    return TransferOf(recv(SocketOf(handle_), room.data(), room.size(), 0));
}

TcpSocket::Transfer TcpSocket::Send(std::string_view bytes) const {
    // A peer that has gone is an error of this call, not a signal to the whole process.
    return TransferOf(send(SocketOf(handle_), bytes.data(), bytes.size(), MSG_NOSIGNAL));
}

void TcpSocket::EndSending() const {
    shutdown(SocketOf(handle_), SHUT_WR);
}

int TcpSocket::Await(std::span<const TcpSocket* const> sockets, Ready ready,
                     std::chrono::milliseconds time) {
    std::vector<pollfd> waiting;
    for (const TcpSocket* const each : sockets)
        waiting.push_back({SocketOf(each->handle_),
                           static_cast<short>(ready == Ready::ToRead ? POLLIN : POLLOUT), 0});
    const int count = poll(waiting.data(), waiting.size(), static_cast<int>(time.count()));
    if (count > 0) return 0;
    return count == 0 || errno == EINTR ? EAGAIN : errno;
}

}  // namespace base
