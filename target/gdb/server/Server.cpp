// Listening, and moving bytes between a socket and a session.

#include "target/gdb/server/Server.h"

#include <chrono>
#include <utility>

#include "target/gdb/server/ClientPort.h"
#include "target/gdb/wire/Frame.h"

namespace target::gdb {

namespace {

using std::chrono::milliseconds;

// A client's silence is no fault; it is only looked up now and then whether to go on.
constexpr std::chrono::milliseconds kBetweenLooks(200);

void Answer(ClientPort& client, Session& session, const Frame& frame) {
    const bool interrupt = frame.kind == Frame::Kind::Interrupt;
    for (const std::string& reply : interrupt ? session.Interrupt() : session.Answer(frame.payload))
        client.Send(reply);
    if (!session.AcknowledgesPackets()) client.StopAcknowledging();
}

}  // namespace

Server::Server(ServedDevice& device, const Address& address, InterruptCheck interrupted,
               ComplaintSink complain)
    : device_(device),
      interrupted_(std::move(interrupted)),
      complain_(std::move(complain)),
      reception_(address, interrupted_) {}

void Server::Run() {
    while (!interrupted_())
        if (auto client = reception_.Next(After(kBetweenLooks))) Serve(std::move(*client));
}

void Server::Serve(Reception::Client arrived) {
    Session session(device_, complain_);
    ClientPort client(std::move(arrived));
    try {
        while (!interrupted_()) {
            for (auto frame = client.Next(); frame && !session.HasEnded(); frame = client.Next())
                Answer(client, session, *frame);
            if (session.HasEnded()) break;
            reception_.TurnAway();
            reception_.Await({&client.Wire()}, After(kBetweenLooks));
            client.Read();
        }
    } catch (const SocketError&) {
        // The client is gone, in order or not.
    }
    device_.ClientGone();
}

}  // namespace target::gdb
