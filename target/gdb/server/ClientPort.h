// ClientPort: a client's connection. It acknowledges, and sends again what arrived damaged, so that
// whoever serves the client deals with requests and answers alone.

#pragma once

#include <deque>
#include <optional>
#include <string>
#include <string_view>

#include "target/gdb/server/Reception.h"
#include "target/gdb/wire/Frame.h"
#include "target/gdb/wire/Socket.h"

namespace target::gdb {

class ClientPort {
  public:
    explicit ClientPort(Reception::Client client);

    /// The next packet or interrupt that has arrived. SocketError, here and below, when the client
    /// is gone.
    std::optional<Frame> Next();

    /// Takes in what has arrived since, without a wait.
    void Read() { decoder_.Feed(socket_.Read({})); }

    /// Whether an interrupt is among what has arrived, which then is taken out, or the client is
    /// gone: either way, nobody waits for what is being done.
    bool IsInterrupted();

    /// Sends a packet. A request's answers are kept until the next request, because a client may
    /// say that they arrived damaged: they are sent again then, and the request isn't carried out
    /// twice.
    void Send(std::string_view payload);
    void Notify(std::string_view payload);

    /// From now on neither side acknowledges packets.
    void StopAcknowledging() { acknowledges_ = false; }

    /// For a wait that includes others.
    const Socket& Wire() const { return socket_; }

  private:
    std::optional<Frame> NextArrived();
    void Write(std::string_view bytes);

    Socket socket_;
    FrameDecoder decoder_{FrameDecoder::Sender::Client};
    std::deque<Frame> waiting_;  ///< that came before an interrupt
    std::string last_;
    bool acknowledges_ = true;
};

}  // namespace target::gdb
