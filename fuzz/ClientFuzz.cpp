// A board behind a GDB server that says what it likes: each line of the input answers one packet,
// or, behind a '!', goes out as it stands. When the lines are at an end, the server hangs up. Every
// operation of the target comes to an end, in time and with nothing but a TargetError.

#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <string>
#include <thread>

#include "fuzz/Require.h"
#include "target/gdb/client/GdbTarget.h"
#include "target/gdb/wire/Frame.h"

namespace {

using namespace target;
using namespace target::gdb;
using namespace std::chrono_literals;

class Server {
  public:
    Server() : listener_(socket(AF_INET, SOCK_STREAM, 0)) {
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof address;
        auto* const any = reinterpret_cast<sockaddr*>(&address);
        Require(bind(listener_, any, size) == 0 && listen(listener_, 4) == 0 &&
                    getsockname(listener_, any, &size) == 0,
                "there is a port");
        port_ = ntohs(address.sin_port);
    }

    Address Where() const { return {"127.0.0.1", std::to_string(port_)}; }

    void Serve(std::string_view lines) const {
        const int client = accept(listener_, nullptr, nullptr);
        // Or the ports would run out, which wait for a while after each connection.
        const linger atOnce{1, 0};
        setsockopt(client, SOL_SOCKET, SO_LINGER, &atOnce, sizeof atOnce);
        FrameDecoder decoder(FrameDecoder::Sender::Client);
        char bytes[4096];
        while (!lines.empty()) {
            const ssize_t got = read(client, bytes, sizeof bytes);
            if (got <= 0) break;
            decoder.Feed({bytes, static_cast<std::size_t>(got)});
            while (const auto frame = decoder.Next())
                if (frame->kind == Frame::Kind::Packet || frame->kind == Frame::Kind::Interrupt)
                    Answer(client, lines);
        }
        close(client);
    }

  private:
    static void Answer(int client, std::string_view& lines) {
        const std::size_t end = std::min(lines.find('\n'), lines.size());
        std::string line(lines.substr(0, end));
        lines.remove_prefix(std::min(end + 1, lines.size()));
        const std::string bytes = line.starts_with('!') ? line.substr(1) : "+" + Framed(line);
        if (write(client, bytes.data(), bytes.size()) < 0) lines = {};
    }

    int listener_;
    std::uint16_t port_ = 0;
};

template <typename Action>
void Try(Action&& action) {
    try {
        action();
    } catch (const TargetError& error) {
        Require(*error.what() != '\0', "a failure says why");
    }
}

void Drive(const Address& where) {
    GdbOptions options;
    options.timeout = std::chrono::milliseconds(20);
    options.ramEnd = 0x20010000;
    Try([&] {
        GdbTarget target(where, options, {0x20001000, 32, 0xFFFFFFFF}, {}, {});
        std::uint32_t words[64] = {};
        Try([&] { target.Read(words, 3, 0x400FE000, 1, 4); });
        Try([&] { target.Write(words, 64, 0x20000000, 1, 4); });
        Try([&] { target.Run(); });
        Try([&] { target.Read(words, 1, 0x2000100C, 1, 4); });
        Try([&] { target.Pause(1ms); });
        Try([&] { target.Halt(); });
        Try([&] { target.Reset(true); });
        Try([&] { target.Release(true); });
    });
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    static const Server server;
    const std::string lines(reinterpret_cast<const char*>(data), size);
    std::thread serving([&] { server.Serve(lines); });
    Drive(server.Where());
    serving.join();
    return 0;
}
