// Connecting, listening, and waiting with poll.

#include "target/gdb/wire/Socket.h"

#include <fcntl.h>
#include <fmt/format.h>
#include <netdb.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <future>
#include <memory>
#include <optional>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

namespace target::gdb {

namespace {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

constexpr milliseconds kBetweenInterruptChecks(100);
constexpr milliseconds kAfterInterrupt(1000);

std::string SystemText(int error) {
    return std::generic_category().message(error);
}

struct AddressList {
    std::unique_ptr<addrinfo, void (*)(addrinfo*)> first{nullptr, freeaddrinfo};
    int error = 0;
};

AddressList LookUp(const Address& address, int flags) {
    addrinfo hints{};
    hints.ai_socktype = SOCK_STREAM;
    hints.ai_flags = flags;
    AddressList list;
    addrinfo* found = nullptr;
    list.error = getaddrinfo(address.host.c_str(), address.port.c_str(), &hints, &found);
    list.first.reset(found);
    return list;
}

// A name server may keep its caller waiting for long, and no look-up can be called off. So it runs
// beside, and is left to itself when the wait is over.
AddressList LookUpBefore(Deadline deadline, const Address& address,
                         const InterruptCheck& interrupted) {
    if (AddressList list = LookUp(address, AI_NUMERICHOST); list.error == 0) return list;
    std::promise<AddressList> promise;
    std::future<AddressList> list = promise.get_future();
    std::thread([address, promise = std::move(promise)]() mutable {
        promise.set_value(LookUp(address, 0));
    }).detach();
    while (list.wait_for(kBetweenInterruptChecks) != std::future_status::ready) {
        if (Clock::now() >= deadline || (interrupted && interrupted()))
            throw SocketError("the look-up of the host's name took too long");
    }
    return list.get();
}

void SetOption(int descriptor, int level, int name, int value) {
    // What can't be set is only less comfortable.
    setsockopt(descriptor, level, name, &value, sizeof value);
}

// A request is a packet of its own and must not wait for more. A peer that vanished without a word
// is noticed after a minute.
void SetUpConnection(int descriptor) {
    SetOption(descriptor, IPPROTO_TCP, TCP_NODELAY, 1);
    SetOption(descriptor, SOL_SOCKET, SO_KEEPALIVE, 1);
    SetOption(descriptor, IPPROTO_TCP, TCP_KEEPIDLE, 30);
    SetOption(descriptor, IPPROTO_TCP, TCP_KEEPINTVL, 10);
    SetOption(descriptor, IPPROTO_TCP, TCP_KEEPCNT, 3);
}

int ConnectionError(int descriptor) {
    int error = 0;
    socklen_t size = sizeof error;
    getsockopt(descriptor, SOL_SOCKET, SO_ERROR, &error, &size);
    return error;
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

// Never blocking: every wait is a poll, which has a limit and can be interrupted.
Socket::Socket(int descriptor, InterruptCheck interrupted)
    : descriptor_(descriptor), interrupted_(std::move(interrupted)) {
    fcntl(descriptor_, F_SETFL, fcntl(descriptor_, F_GETFL) | O_NONBLOCK);
}

Socket::~Socket() {
    Close();
}

Socket::Socket(Socket&& other) noexcept
    : descriptor_(std::exchange(other.descriptor_, -1)),
      interrupted_(std::move(other.interrupted_)) {}

Socket& Socket::operator=(Socket&& other) noexcept {
    Close();
    descriptor_ = std::exchange(other.descriptor_, -1);
    interrupted_ = std::move(other.interrupted_);
    return *this;
}

void Socket::Close() {
    if (IsOpen()) close(std::exchange(descriptor_, -1));
}

void Socket::EndWriting() const {
    shutdown(descriptor_, SHUT_WR);
}

Socket Socket::Connect(const Address& address, Deadline deadline,
                       const InterruptCheck& interrupted) {
    const AddressList list = LookUpBefore(deadline, address, interrupted);
    if (list.error != 0) throw SocketError(gai_strerror(list.error));
    int error = 0;
    for (const addrinfo* each = list.first.get(); each != nullptr; each = each->ai_next) {
        const int descriptor = socket(each->ai_family, SOCK_STREAM | SOCK_CLOEXEC, 0);
        if (descriptor < 0) {
            error = errno;
            continue;
        }
        Socket connection(descriptor, interrupted);
        SetUpConnection(descriptor);
        error = 0;
        if (connect(descriptor, each->ai_addr, each->ai_addrlen) != 0) error = errno;
        // An interrupted connect goes on by itself, like one that can't be had at once.
        if (error == EINPROGRESS || error == EINTR)
            error = connection.Await(POLLOUT, deadline) ? ConnectionError(descriptor) : ETIMEDOUT;
        if (error == 0) return connection;
        if (interrupted && interrupted()) break;
    }
    throw SocketError(SystemText(error));
}

Socket Socket::Listen(const Address& address, InterruptCheck interrupted) {
    const AddressList list = LookUp(address, AI_PASSIVE);
    if (list.error != 0) throw SocketError(gai_strerror(list.error));
    const addrinfo& first = *list.first;
    const int descriptor = socket(first.ai_family, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (descriptor < 0) throw SocketError(SystemText(errno));
    Socket listener(descriptor, std::move(interrupted));
    SetOption(descriptor, SOL_SOCKET, SO_REUSEADDR, 1);
    if (bind(descriptor, first.ai_addr, first.ai_addrlen) != 0 || listen(descriptor, 4) != 0)
        throw SocketError(SystemText(errno));
    return listener;
}

std::uint16_t Socket::Port() const {
    sockaddr_storage name{};
    socklen_t size = sizeof name;
    getsockname(descriptor_, reinterpret_cast<sockaddr*>(&name), &size);
    std::array<char, 8> port{};
    getnameinfo(reinterpret_cast<sockaddr*>(&name), size, nullptr, 0, port.data(), port.size(),
                NI_NUMERICSERV);
    return static_cast<std::uint16_t>(std::stoul(port.data()));
}

Socket Socket::Accept(Deadline deadline) {
    while (Await(POLLIN, deadline)) {
        const int descriptor = accept4(descriptor_, nullptr, nullptr, SOCK_CLOEXEC);
        // Other errors are those of a client that has gone again; the next one may come.
        if (descriptor < 0 && errno == EMFILE) throw SocketError(SystemText(errno));
        if (descriptor < 0) continue;
        SetUpConnection(descriptor);
        return {descriptor, interrupted_};
    }
    return {};
}

std::string Socket::Read(Deadline deadline) {
    std::array<char, 4096> bytes;
    while (Await(POLLIN, deadline)) {
        const ssize_t got = recv(descriptor_, bytes.data(), bytes.size(), 0);
        if (got > 0) return {bytes.data(), static_cast<std::size_t>(got)};
        if (got == 0) throw SocketError("it closed the connection");
        if (errno != EINTR && errno != EAGAIN)
            throw SocketError("the connection broke: " + SystemText(errno));
    }
    return {};
}

void Socket::Write(std::string_view bytes, Deadline deadline) {
    while (!bytes.empty()) {
        // A peer that has gone is an error of this call, not a signal to the whole process.
        const ssize_t put = send(descriptor_, bytes.data(), bytes.size(), MSG_NOSIGNAL);
        if (put > 0) {
            bytes.remove_prefix(static_cast<std::size_t>(put));
        } else if (errno != EINTR && errno != EAGAIN) {
            throw SocketError("the connection broke: " + SystemText(errno));
        } else if (!Await(POLLOUT, deadline)) {
            throw SocketError("it takes no more bytes");
        }
    }
}

Deadline Socket::Until(Deadline deadline) const {
    return interrupted_ && interrupted_() ? std::min(deadline, After(kAfterInterrupt)) : deadline;
}

bool Socket::Await(short events, Deadline deadline) const {
    const Socket* const self = this;
    return Poll({&self, 1}, events, deadline);
}

void Socket::AwaitAny(std::span<const Socket* const> sockets, Deadline deadline) {
    Poll(sockets, POLLIN, deadline);
}

// In slices, for a signal may come between the check and the wait.
bool Socket::Poll(std::span<const Socket* const> sockets, short events, Deadline deadline) {
    std::vector<pollfd> waiting;
    for (const Socket* const each : sockets)
        waiting.push_back({each->descriptor_, events, 0});
    for (;;) {
        deadline = sockets.front()->Until(deadline);
        const auto left = std::chrono::ceil<milliseconds>(deadline - Clock::now());
        const auto slice = std::clamp(left, milliseconds(0), kBetweenInterruptChecks);
        const int ready = poll(waiting.data(), waiting.size(), static_cast<int>(slice.count()));
        if (ready > 0) return true;
        if (ready < 0 && errno != EINTR) throw SocketError(SystemText(errno));
        if (left <= milliseconds(0)) return false;
    }
}

}  // namespace target::gdb
