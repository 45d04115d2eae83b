// Sockets of Windows.

#include "base/system/TcpSocket.h"

#include <winsock2.h>
#include <ws2tcpip.h>
// They need what stands above.
#include <mstcpip.h>

#include <array>
#include <cerrno>
#include <memory>
#include <utility>

#include "base/system/windows/Text.h"

namespace base {

namespace {

SOCKET SocketOf(TcpSocket::Handle handle) {
    return static_cast<SOCKET>(handle);
}

const sockaddr* Name(const TcpAddress& address) {
    return reinterpret_cast<const sockaddr*>(address.bytes.data());
}

int NameSize(const TcpAddress& address) {
    return static_cast<int>(address.bytes.size());
}

int NumberOf(int error) {
    static constexpr std::pair<int, int> kNumbers[] = {
        {WSAEWOULDBLOCK, EAGAIN},
        {WSAEINTR, EAGAIN},
        {WSAEACCES, EACCES},
        {WSAEMFILE, EMFILE},
        {WSAEADDRINUSE, EADDRINUSE},
        {WSAEADDRNOTAVAIL, EADDRNOTAVAIL},
        {WSAEAFNOSUPPORT, EAFNOSUPPORT},
        {WSAECONNABORTED, ECONNABORTED},
        {WSAECONNREFUSED, ECONNREFUSED},
        {WSAECONNRESET, ECONNRESET},
        {WSAEHOSTUNREACH, EHOSTUNREACH},
        {WSAENETDOWN, ENETDOWN},
        {WSAENETRESET, ECONNRESET},
        {WSAENETUNREACH, ENETUNREACH},
        {WSAENOBUFS, ENOBUFS},
        {WSAENOTCONN, ENOTCONN},
        {WSAESHUTDOWN, EPIPE},
        {WSAETIMEDOUT, ETIMEDOUT},
        {WSAEINVAL, EINVAL},
    };
    if (error == 0) return 0;
    for (const auto& [theirs, number] : kNumbers)
        if (theirs == error) return number;
    return EIO;
}

int ErrorOf(int result) {
    return result == SOCKET_ERROR ? NumberOf(WSAGetLastError()) : 0;
}

TcpSocket::Transfer TransferOf(int bytes) {
    return {static_cast<std::size_t>(bytes > 0 ? bytes : 0), ErrorOf(bytes)};
}

void SetOption(SOCKET socket, int level, int name, int value) {
    // What can't be set is only less comfortable.
    setsockopt(socket, level, name, reinterpret_cast<const char*>(&value), sizeof value);
}

// A request is a packet of its own and must not wait for more. A peer that vanished without a word
// is noticed after a minute or two.
void SetUpConnection(SOCKET socket) {
    SetOption(socket, IPPROTO_TCP, TCP_NODELAY, 1);
    tcp_keepalive alive{1, 30000, 10000};
    DWORD unused = 0;
    WSAIoctl(socket, SIO_KEEPALIVE_VALS, &alive, sizeof alive, nullptr, 0, &unused, nullptr,
             nullptr);
}

void StartUp() {
    static const int kStarted = [] {
        WSADATA data{};
        return WSAStartup(MAKEWORD(2, 2), &data);
    }();
    static_cast<void>(kStarted);
}

std::string LookUpText(int error) {
    switch (error) {
        case WSAHOST_NOT_FOUND:
        case WSANO_DATA:
            return "Name or service not known";
        case WSATRY_AGAIN:
            return "Temporary failure in name resolution";
        case WSATYPE_NOT_FOUND:
            return "Servname not supported for ai_socktype";
        default:
            return "the look-up of the host's name failed, error " + std::to_string(error);
    }
}

}  // namespace

TcpAddresses LookUpTcp(const std::string& host, const std::string& port, LookUp how) {
    StartUp();
    addrinfoW hints{};
    hints.ai_socktype = SOCK_STREAM;
    hints.ai_flags = how == LookUp::Number     ? AI_NUMERICHOST
                     : how == LookUp::ToListen ? AI_PASSIVE
                                               : 0;
    addrinfoW* found = nullptr;
    const int error = GetAddrInfoW(Utf16(host).c_str(), Utf16(port).c_str(), &hints, &found);
    const std::unique_ptr<addrinfoW, decltype(&FreeAddrInfoW)> list(found, FreeAddrInfoW);
    if (error != 0) return {{}, LookUpText(error)};
    TcpAddresses addresses;
    for (const addrinfoW* each = found; each != nullptr; each = each->ai_next)
        addresses.addresses.push_back(
            {each->ai_family,
             std::string(reinterpret_cast<const char*>(each->ai_addr), each->ai_addrlen)});
    return addresses;
}

TcpSocket::TcpSocket(Handle handle) : handle_(handle) {
    u_long nonBlocking = 1;
    ioctlsocket(SocketOf(handle_), static_cast<long>(FIONBIO), &nonBlocking);
}

void TcpSocket::Close() {
    if (IsOpen()) closesocket(SocketOf(handle_));
}

int TcpSocket::Open(int family) {
    StartUp();
    const SOCKET opened = WSASocketW(family, SOCK_STREAM, 0, nullptr, 0,
                                     WSA_FLAG_OVERLAPPED | WSA_FLAG_NO_HANDLE_INHERIT);
    if (opened == INVALID_SOCKET) return NumberOf(WSAGetLastError());
    *this = TcpSocket(static_cast<Handle>(opened));
    return 0;
}

int TcpSocket::Connect(const TcpAddress& address) {
    if (const int error = Open(address.family); error != 0) return error;
    SetUpConnection(SocketOf(handle_));
    const int error = ErrorOf(connect(SocketOf(handle_), Name(address), NameSize(address)));
    return error == EAGAIN ? EINPROGRESS : error;
}

int TcpSocket::PendingError() const {
    int error = 0;
    int size = sizeof error;
    getsockopt(SocketOf(handle_), SOL_SOCKET, SO_ERROR, reinterpret_cast<char*>(&error), &size);
    return NumberOf(error);
}

int TcpSocket::Listen(const TcpAddress& address) {
    if (const int error = Open(address.family); error != 0) return error;
    // Nobody else can have the port. It is free again as soon as its last server has ended.
    SetOption(SocketOf(handle_), SOL_SOCKET, SO_EXCLUSIVEADDRUSE, 1);
    const int error = ErrorOf(bind(SocketOf(handle_), Name(address), NameSize(address)));
    if (error != 0) return error == EACCES ? EADDRINUSE : error;
    return ErrorOf(listen(SocketOf(handle_), 4));
}

std::uint16_t TcpSocket::Port() const {
    sockaddr_storage name{};
    int size = sizeof name;
    getsockname(SocketOf(handle_), reinterpret_cast<sockaddr*>(&name), &size);
    std::array<char, 8> port{};
    getnameinfo(reinterpret_cast<sockaddr*>(&name), size, nullptr, 0, port.data(),
                static_cast<DWORD>(port.size()), NI_NUMERICSERV);
    return static_cast<std::uint16_t>(std::stoul(port.data()));
}

int TcpSocket::Accept(TcpSocket& client) const {
    const SOCKET accepted = accept(SocketOf(handle_), nullptr, nullptr);
    if (accepted == INVALID_SOCKET) return NumberOf(WSAGetLastError());
    SetUpConnection(accepted);
    client = TcpSocket(static_cast<Handle>(accepted));
    return 0;
}

TcpSocket::Transfer TcpSocket::Receive(std::span<char> room) const {
    return TransferOf(recv(SocketOf(handle_), room.data(), static_cast<int>(room.size()), 0));
}

TcpSocket::Transfer TcpSocket::Send(std::string_view bytes) const {
    return TransferOf(send(SocketOf(handle_), bytes.data(), static_cast<int>(bytes.size()), 0));
}

void TcpSocket::EndSending() const {
    shutdown(SocketOf(handle_), SD_SEND);
}

// A connection that failed is not ready to write: it is on a third list, which nobody needs who
// reads.
int TcpSocket::Await(std::span<const TcpSocket* const> sockets, Ready ready,
                     std::chrono::milliseconds time) {
    fd_set waiting;
    FD_ZERO(&waiting);
    for (const TcpSocket* const each : sockets)
        FD_SET(SocketOf(each->handle_), &waiting);
    fd_set failed = waiting;
    timeval slice{static_cast<long>(time.count() / 1000),
                  static_cast<long>(time.count() % 1000 * 1000)};
    const int count = ready == Ready::ToRead ? select(0, &waiting, nullptr, nullptr, &slice)
                                             : select(0, nullptr, &waiting, &failed, &slice);
    if (count > 0) return 0;
    return count == 0 ? EAGAIN : NumberOf(WSAGetLastError());
}

}  // namespace base
