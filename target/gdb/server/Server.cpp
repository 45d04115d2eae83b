// Listening, and moving bytes between a socket and a session.

#include "target/gdb/server/Server.h"

#include <chrono>
#include <utility>

#include "target/gdb/wire/Frame.h"

namespace target::gdb {

namespace {

using std::chrono::milliseconds;

// A client's silence is no fault; it is only looked up now and then whether to go on.
constexpr milliseconds kBetweenLooks(200);
constexpr milliseconds kToTakeAReply(10000);

/// One client's bytes, from frames to replies. The last replies are kept, because a client may say
/// that they arrived damaged; they are sent again then, and the request is not carried out twice.
class Client {
  public:
    Client(Socket& socket, Session& session) : socket_(socket), session_(session) {}

    void Take(const Frame& frame) {
        // Asked before the request is answered: the one that ends acknowledgements is the last to
        // get one.
        const bool acknowledges = session_.AcknowledgesPackets();
        switch (frame.kind) {
            case Frame::Kind::Packet:
                if (acknowledges) Send("+");
                return SendAll(session_.Answer(frame.payload));
            case Frame::Kind::Damaged:
                if (acknowledges) Send("-");
                return;
            case Frame::Kind::Nak:
                return Send(last_);
            case Frame::Kind::Interrupt:
                return SendAll(session_.Interrupt());
            case Frame::Kind::Ack:
            case Frame::Kind::Notification:
                return;
        }
    }

  private:
    void SendAll(const std::vector<std::string>& payloads) {
        last_.clear();
        for (const std::string& payload : payloads)
            last_ += Framed(payload);
        Send(last_);
    }
    void Send(const std::string& bytes) { socket_.Write(bytes, After(kToTakeAReply)); }

    Socket& socket_;
    Session& session_;
    std::string last_;
};

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

void Server::Serve(Reception::Client served) {
    Session session(device_, complain_);
    Client client(served.socket, session);
    FrameDecoder decoder(FrameDecoder::Sender::Client);
    decoder.Feed(served.said);
    try {
        while (!session.HasEnded() && !interrupted_()) {
            while (!session.HasEnded()) {
                const auto frame = decoder.Next();
                if (!frame) break;
                client.Take(*frame);
            }
            if (session.HasEnded()) break;
            reception_.TurnAway();
            reception_.Await({&served.socket}, After(kBetweenLooks));
            decoder.Feed(served.socket.Read({}));
        }
    } catch (const SocketError&) {
        // The client is gone, in order or not.
    }
    device_.ClientGone();
}

}  // namespace target::gdb
