// Listening to all who have connected, until one of them asks for something.

#include "target/gdb/server/Reception.h"

#include <initializer_list>
#include <utility>
#include <vector>

#include "target/gdb/wire/Frame.h"

namespace target::gdb {

namespace {

constexpr std::size_t kGuestsMax = 16;

// Frames begin so. A browser, which can be made to send anything behind its own first line,
// doesn't.
constexpr std::string_view kFirstBytes = "+-$\x03";

/// A whole packet, or an interrupt.
bool Asks(const std::string& said) {
    return said.find('#') != said.npos || said.find(kInterrupt) != said.npos;
}

/// False for somebody who has hung up, or isn't a debugger. Whoever has hung up gets no answer any
/// more, and so nothing is done for them.
bool Listen(Reception::Client& guest) try {
    for (std::string more = "?"; !more.empty() && guest.said.size() <= kPayloadMax;) {
        more = guest.socket.Read({});
        guest.said += more;
        if (!guest.said.empty() && kFirstBytes.find(guest.said[0]) == kFirstBytes.npos)
            return false;
    }
    return guest.said.size() <= kPayloadMax;
} catch (const SocketError&) {
    return false;
}

}  // namespace

Reception::Reception(const Address& address, InterruptCheck interrupted)
    : listener_(Socket::Listen(address, std::move(interrupted))) {}

std::optional<Reception::Client> Reception::Next(Deadline deadline) {
    if (auto client = FirstWhoAsks()) return client;
    Await({}, deadline);
    return FirstWhoAsks();
}

void Reception::TurnAway() try {
    while (auto client = FirstWhoAsks())
        client->socket.Write("+" + Framed("E.serves another client"), {});
} catch (const SocketError&) {
    // Whoever doesn't listen has gone already.
}

void Reception::Await(std::initializer_list<const Socket*> served, Deadline deadline) const {
    std::vector<const Socket*> sockets(served);
    sockets.push_back(&listener_);
    for (const Client& guest : guests_)
        sockets.push_back(&guest.socket);
    Socket::AwaitAny(sockets, deadline);
}

std::optional<Reception::Client> Reception::FirstWhoAsks() {
    LetIn();
    for (auto guest = guests_.begin(); guest != guests_.end();) {
        const bool stays = Listen(*guest);
        const bool asks = stays && Asks(guest->said);
        Client client = asks ? std::move(*guest) : Client{};
        guest = stays && !asks ? std::next(guest) : guests_.erase(guest);
        if (asks) return client;
    }
    return std::nullopt;
}

void Reception::LetIn() {
    for (Socket socket = listener_.Accept({}); socket.IsOpen(); socket = listener_.Accept({})) {
        guests_.push_back({std::move(socket), {}});
        if (guests_.size() > kGuestsMax) guests_.pop_front();
    }
}

}  // namespace target::gdb
