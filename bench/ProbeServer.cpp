#include "bench/ProbeServer.h"

#include "base/Hex.h"
#include "target/gdb/server/Arguments.h"
#include "target/gdb/wire/Frame.h"

namespace bench {

namespace {

namespace gdb = target::gdb;

constexpr std::chrono::milliseconds kBetweenLooks(50);

}  // namespace

ProbeServer::ProbeServer(const std::string& device, bool answersAsItRuns)
    : answersAsItRuns_(answersAsItRuns),
      device_(target::ParseDeviceOptions(device)),
      served_(
          device_, [](const std::string&) {}, [] {}),
      session_(served_, [](const std::string&) {}),
      listener_(
          gdb::Socket::Listen(gdb::Address::Parse("127.0.0.1:0"), [this] { return done_.load(); })),
      thread_([this] { Serve(); }) {}

ProbeServer::~ProbeServer() {
    done_ = true;
    thread_.join();
}

gdb::Address ProbeServer::Where() const {
    return {"127.0.0.1", std::to_string(listener_.Port())};
}

void ProbeServer::Serve() try {
    gdb::Socket client = listener_.Accept(gdb::After(std::chrono::seconds(10)));
    gdb::FrameDecoder decoder(gdb::FrameDecoder::Sender::Client);
    while (client.IsOpen() && !done_) {
        decoder.Feed(client.Read(gdb::After(kBetweenLooks)));
        while (const auto frame = decoder.Next()) {
            std::string wire;
            const bool interrupt = frame->kind == gdb::Frame::Kind::Interrupt;
            if (!interrupt && frame->kind != gdb::Frame::Kind::Packet) continue;
            if (!interrupt && session_.AcknowledgesPackets()) wire = "+";
            if (const auto reply = interrupt ? std::nullopt : AnswerAsItRuns(frame->payload)) {
                wire += gdb::Framed(*reply);
            } else {
                for (const std::string& payload :
                     interrupt ? session_.Interrupt() : session_.Answer(frame->payload))
                    wire += gdb::Framed(payload);
            }
            client.Write(wire, gdb::After(std::chrono::seconds(1)));
        }
    }
} catch (const gdb::SocketError&) {
    // The client is gone.
}

std::optional<std::string> ProbeServer::AnswerAsItRuns(std::string_view payload) {
    gdb::Arguments request;
    if (!answersAsItRuns_ || !served_.IsRunning() || payload.empty()) return std::nullopt;
    const std::string_view rest = payload.substr(1);
    if (payload.front() == 'm' && gdb::Range(rest, request))
        return base::ToHex(served_.Read(request.address, request.length, 1));
    const bool writes = payload.front() == 'M'   ? gdb::HexBytes(rest, request)
                        : payload.front() == 'X' ? gdb::BinaryBytes(rest, request)
                                                 : false;
    if (!writes) return std::nullopt;
    served_.Write(request.address, request.data, 1);
    return "OK";
}

}  // namespace bench
