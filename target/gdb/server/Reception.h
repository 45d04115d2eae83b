// Reception: who is served. One client at a time, and that is the first who asks for something; who
// only connects holds nobody up.

#pragma once

#include <cstdint>
#include <list>
#include <optional>
#include <string>

#include "target/gdb/wire/Socket.h"

namespace target::gdb {

class Reception {
  public:
    struct Client {
        Socket socket;
        std::string said;  ///< what has arrived from it
    };

    /// Listens at once; port 0 takes a free one. SocketError.
    Reception(const Address& address, InterruptCheck interrupted);

    std::uint16_t Port() const { return listener_.Port(); }

    /// The next client who asks for something; nothing when none does before the deadline.
    std::optional<Client> Next(Deadline deadline);

    /// To be called again and again while a client is served: tells everybody else who asks for
    /// something that there is one, and lets them go.
    void TurnAway();

    /// Waits until one of these sockets, or somebody new, has something to say.
    void Await(std::initializer_list<const Socket*> served, Deadline deadline) const;

  private:
    std::optional<Client> FirstWhoAsks();
    void LetIn();

    Socket listener_;
    std::list<Client> guests_;  ///< who haven't asked for anything; none has hung up so far
};

}  // namespace target::gdb
