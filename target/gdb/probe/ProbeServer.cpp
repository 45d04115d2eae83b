// Listening to debugger and probe at the same time.

#include "target/gdb/probe/ProbeServer.h"

#include <fmt/format.h>

#include <chrono>
#include <utility>

namespace target::gdb {

namespace {

constexpr std::chrono::milliseconds kBetweenWaits(200);

}  // namespace

ProbeServer::ProbeServer(ConnectProbe connect, OpenFlash open, const Address& address,
                         InterruptCheck interrupted, ComplaintSink complain)
    : connect_(std::move(connect)),
      open_(std::move(open)),
      interrupted_(std::move(interrupted)),
      complain_(std::move(complain)),
      reception_(address, interrupted_) {}

void ProbeServer::Run() {
    while (!interrupted_()) {
        auto arrived = reception_.Next(After(kBetweenWaits));
        if (!arrived) continue;
        ClientPort client(std::move(*arrived));
        try {
            Serve(client);
        } catch (const SocketError&) {
            // The debugger is gone, in order or not.
        }
    }
}

void ProbeServer::Serve(ClientPort& client) {
    std::unique_ptr<GdbTarget> probe;
    try {
        probe = connect_();
    } catch (const TargetError& error) {
        complain_(error.what());
        client.Next();
        return client.Send(Escaped(fmt::format("E.{}", error.what())));
    }
    ProbeSession session(client, *probe, open_, complain_);
    try {
        Relay(client, *probe, session);
    } catch (const SocketError&) {
        // As above; what it had is put back first.
    } catch (const ProtocolError& error) {
        if (!session.IsEnding()) complain_(fmt::format("the GDB server {}", error.what()));
    }
    session.Leave();
}

void ProbeServer::Relay(ClientPort& client, GdbTarget& probe, ProbeSession& session) {
    while (!interrupted_()) {
        while (const auto frame = client.Next())
            session.Take(*frame);
        probe.Wire().TakeArrived();
        reception_.TurnAway();
        reception_.Await({&client.Wire(), &probe.Wire().Wire()}, After(kBetweenWaits));
        client.Read();
    }
}

}  // namespace target::gdb
