// The GDB remote protocol from both sides. The first byte chooses: what a server sends, through the
// frame decoder and every parser of replies; or what a client sends, to a served device, which must
// answer whatever comes.

#include <algorithm>

#include "fuzz/Require.h"
#include "target/gdb/client/GdbOptions.h"
#include "target/gdb/client/RegisterNumbers.h"
#include "target/gdb/server/Session.h"
#include "target/gdb/wire/Frame.h"
#include "target/gdb/wire/Replies.h"
#include "target/gdb/wire/Socket.h"
#include "target/simulated/ServedSimulation.h"

namespace {

using namespace target;
using namespace target::gdb;

void ReadReply(const std::string& reply) {
    ParseStopReply(reply);
    Require(ParseFeatures(reply).packetSize <= 0x4000, "a PacketSize is bounded");
    OffersContinue(reply);
    if (const auto piece = ParseDocumentPiece(reply))
        Require(piece->bytes.size() < reply.size(), "a piece lies in its reply");
    try {
        ReadRegisterNumbers([&](const std::string&) { return reply; });
    } catch (const DescriptionError& error) {
        RequireText(error.what());
    }
    try {
        GdbOptions options;
        ParseGdbOption(reply, options);
        Address::Parse(reply);
    } catch (const std::invalid_argument& error) {
        RequireText(error.what());
    }
}

void ReadFromServer(std::string_view bytes) {
    FrameDecoder whole(FrameDecoder::Sender::Server);
    FrameDecoder cut(FrameDecoder::Sender::Server);
    whole.Feed(bytes);
    std::size_t fed = 0;
    while (const auto frame = whole.Next()) {
        auto same = cut.Next();
        for (; !same && fed < bytes.size(); same = cut.Next())
            cut.Feed(bytes.substr(fed++, 1));
        Require(same && same->kind == frame->kind && same->payload == frame->payload,
                "frames don't depend on how their bytes arrive");
        ReadReply(frame->payload);
    }
}

void AnswerClient(std::string_view bytes) {
    static const DeviceOptions kOptions = ParseDeviceOptions("quen,flash=16K,ram=8K");
    SimulatedDevice device(kOptions);
    ServedSimulation served(
        device, [](const std::string&) {}, [] {});
    Session session(served, [](const std::string& text) { RequireText(text.c_str()); });
    // One request a line, for the mutations to find.
    while (!bytes.empty() && !session.HasEnded()) {
        const std::size_t end = std::min(bytes.find('\n'), bytes.size());
        const std::string_view payload = bytes.substr(0, end);
        const auto replies = payload == "\x03" ? session.Interrupt() : session.Answer(payload);
        for (const std::string& reply : replies)
            Require(reply.size() <= Session::kPacketSize, "a reply fits a packet");
        bytes.remove_prefix(std::min(end + 1, bytes.size()));
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size == 0) return 0;
    const std::string_view bytes(reinterpret_cast<const char*>(data) + 1, size - 1);
    if (data[0] % 2 == 0) {
        ReadFromServer(bytes);
        // The same without the checksum in the way.
        ReadReply(std::string(bytes));
    } else {
        AnswerClient(bytes);
    }
    return 0;
}
