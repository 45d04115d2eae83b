// register_lender PORT: QEMU's generic board as if it were a device of the family. It stands in
// front of QEMU's GDB server at that port, passes everything on, and lends the board the registers
// that it lacks, which are a simulated device's. What these erase is erased in the board's memory.

#include <fmt/format.h>

#include <cstdio>

#include "base/ByteOrder.h"
#include "base/Hex.h"
#include "target/gdb/server/Arguments.h"
#include "target/gdb/server/ClientPort.h"
#include "target/gdb/wire/Frame.h"
#include "target/simulated/SimulatedDevice.h"

namespace {

using namespace target;
using namespace target::gdb;
using namespace std::chrono_literals;

constexpr std::uint32_t kSectorBytes = 1024;
constexpr std::uint32_t kFlashAddress = 0x400FD000;
constexpr std::uint32_t kFlashCommand = 0x400FD008;

class Lender {
  public:
    Lender(ClientPort& client, const Address& board)
        : client_(client),
          board_(Socket::Connect(board, After(5s), {})),
          device_(ParseDeviceOptions("quen,flash=256K,ram=64K,erase-time=1ms")) {
        device_.Halt();
    }

    void Run() {
        for (;;) {
            while (const auto frame = client_.Next())
                Take(*frame);
            Socket::AwaitAny(std::vector<const Socket*>{&client_.Wire(), &board_}, After(100ms));
            client_.Read();
            while (const auto reply = NextReply({}))
                client_.Send(Escaped(*reply));
        }
    }

  private:
    void Take(const Frame& frame) {
        if (frame.kind == Frame::Kind::Interrupt) return board_.Write("\x03", After(1s));
        const std::string_view payload = frame.payload;
        Arguments at;
        const std::string_view rest = payload.substr(1);
        const bool reads = payload[0] == 'm' && Range(rest, at);
        if (!reads && !(payload[0] == 'M' && HexBytes(rest, at)) &&
            !(payload[0] == 'X' && BinaryBytes(rest, at)))
            at.address = 0;
        if (payload.starts_with("qRcmd,")) device_.Reset(true);
        if (at.address == 0x10000000) return client_.Send("E01");
        if (at.address >> 28 != 4) return Send(frame.payload);
        try {
            client_.Send(reads ? Read(at) : Write(at));
        } catch (const TargetError& error) {
            std::fprintf(stderr, "%s\n", error.what());
            client_.Send("E01");
        }
    }

    std::string Read(const Arguments& at) {
        std::string bytes(at.length, '\0');
        device_.Read(bytes.data(), bytes.size() / 4, at.address, 1, 4);
        return base::ToHex(bytes);
    }

    std::string Write(const Arguments& at) {
        device_.Write(at.data.data(), at.data.size() / 4, at.address, 1, 4);
        if (at.address == kFlashAddress) sector_ = base::WordOf(at.data);
        const bool all = (base::WordOf(at.data) & 4) != 0;
        for (std::uint32_t done = 0; at.address == kFlashCommand && done < (all ? 256U : 1U);
             ++done) {
            const std::uint32_t first = all ? done * kSectorBytes : sector_;
            Send(fmt::format("M{:x},{:x}:", first, kSectorBytes) +
                 base::ToHex(std::string(kSectorBytes, '\xFF')));
            if (NextReply(After(5s)) != "OK") return "E01";
        }
        return "OK";
    }

    void Send(const std::string& payload) { board_.Write(Framed(Escaped(payload)), After(1s)); }

    std::optional<std::string> NextReply(Deadline deadline) {
        for (;;) {
            while (const auto frame = decoder_.Next()) {
                if (frame->kind != Frame::Kind::Packet) continue;
                board_.Write("+", After(1s));
                return frame->payload;
            }
            const std::string bytes = board_.Read(deadline);
            if (bytes.empty()) return std::nullopt;
            decoder_.Feed(bytes);
        }
    }

    ClientPort& client_;
    Socket board_;
    FrameDecoder decoder_{FrameDecoder::Sender::Server};
    SimulatedDevice device_;
    std::uint32_t sector_ = 0;
};

}  // namespace

int main(int, char** argv) {
    Reception reception(Address::Parse("127.0.0.1:0"), {});
    std::printf("%u\n", reception.Port());
    std::fflush(stdout);
    auto arrived = reception.Next(After(60s));
    while (!arrived)
        arrived = reception.Next(After(60s));
    ClientPort client(std::move(*arrived));
    try {
        Lender(client, Address::Parse(argv[1])).Run();
    } catch (const std::runtime_error& error) {
        std::fprintf(stderr, "%s\n", error.what());
    }
}
