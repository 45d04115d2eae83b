// Debugger: a debugger's end of a probe with flash added, the session, and what lies behind it: the
// plug-in, which programs through the probe.

#pragma once

#include <sys/socket.h>

#include <chrono>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "host/driver/FlashDevice.h"
#include "host/flashing/DebuggerLoad.h"
#include "host/targets/GdbServerTarget.h"
#include "target/gdb/probe/ProbeSession.h"
#include "target/gdb/wire/Frame.h"
#include "tests/gdb/Peer.h"

namespace test {

class Debugger {
  public:
    /// How a request, or its answer, comes through.
    enum class Way { Plain, Damaged, Refused, Late };

    explicit Debugger(Peer& peer, Way way = Way::Plain)
        : way_(way),
          reporter_({host::Verbosity::Quiet, false, "none"}),
          open_([this](target::gdb::GdbTarget& probe) { return FlashOf(probe); }),
          complain_([this](const std::string& text) { complaints += text + "\n"; }) {
        host::TargetOptions options;
        options.gdb = "127.0.0.1:" + peer.Where().port;  // a look-up of a name takes real time
        options.loader = LoaderFile();
        options.gdbOptions = {"timeout=1s"};
        probe_ = host::ProbeConnector(options, {}).Connect();
        int ends[2] = {};
        if (socketpair(AF_UNIX, SOCK_STREAM, 0, ends) != 0) throw SocketError("no pair");
        handle_ = ends[0];
        own_ = Socket(base::TcpSocket(ends[0]), {});
        client_.emplace(target::gdb::Reception::Client{Socket(base::TcpSocket(ends[1]), {}), ""});
        if (way == Way::Plain) client_->StopAcknowledging();
        session_.emplace(*client_, *probe_, open_, complain_);
    }

    /// The answer; none when the connection ends, or nothing comes.
    std::optional<std::string> Ask(const std::string& request) try {
        std::string frame = Framed(target::gdb::Escaped(request));
        if (way_ == Way::Damaged) {
            std::string damaged = frame;
            damaged.back() = damaged.back() == '0' ? '1' : '0';
            if (Exchange(damaged, Frame::Kind::Nak) == std::nullopt) return std::nullopt;
        }
        if (way_ == Way::Late) {
            own_.Write(frame.substr(0, frame.size() / 2), After(std::chrono::seconds(1)));
            client_->Read();
            if (client_->Next()) return std::nullopt;
            frame.erase(0, frame.size() / 2);
        }
        auto answer = Exchange(frame, Frame::Kind::Packet);
        if (way_ == Way::Refused && Exchange("-", Frame::Kind::Packet) != answer)
            return std::nullopt;
        return answer;
    } catch (const std::runtime_error&) {
        return std::nullopt;
    }

    /// The same for bytes that may be no request at all.
    std::optional<std::string> Say(const std::string& bytes) try {
        return Exchange(bytes, Frame::Kind::Packet);
    } catch (const std::runtime_error&) {
        return std::nullopt;
    }

    // From any thread.
    void Interrupt() const { (void)!write(handle_, "\x03", 1); }
    void HangUp() const { shutdown(handle_, SHUT_RDWR); }

    void Leave() { session_->Leave(); }

    std::string complaints;
    std::chrono::milliseconds patience{3000};  ///< for an answer

  private:
    /// The next frame of this kind that comes back.
    std::optional<std::string> Exchange(const std::string& bytes, Frame::Kind kind) {
        using std::chrono::steady_clock;
        own_.Write(bytes, After(std::chrono::seconds(1)));
        client_->Read();
        for (const auto end = After(patience); steady_clock::now() < end;) {
            while (const auto frame = client_->Next())
                session_->Take(*frame);
            decoder_.Feed(own_.Read({}));
            while (const auto frame = decoder_.Next())
                if (frame->kind == kind && !frame->payload.starts_with("O4")) return frame->payload;
            Socket::AwaitAny(std::vector<const Socket*>{&own_, &probe_->Wire().Wire()},
                             After(std::chrono::milliseconds(20)));
            probe_->Wire().TakeArrived();
        }
        return std::nullopt;
    }

    std::unique_ptr<target::gdb::FlashProgrammer> FlashOf(target::gdb::GdbTarget& probe) {
        return std::make_unique<host::DebuggerLoad>(
            [this, &probe](host::SettingStore& settings) {
                return std::make_unique<host::FlashDevice>(
                    std::make_unique<host::GdbServerTarget>(probe),
                    host::DeviceOptions{{}, FLASH_CORVANE_LIBRARY}, settings, reporter_);
            },
            [&probe] { return host::LoaderMemory(probe, ""); }, settings_);
    }

    const Way way_;
    host::SettingStore settings_;
    host::Reporter reporter_;
    const target::gdb::OpenFlash open_;
    const target::gdb::ComplaintSink complain_;
    std::unique_ptr<target::gdb::GdbTarget> probe_;
    int handle_ = -1;
    Socket own_;
    FrameDecoder decoder_{FrameDecoder::Sender::Server};
    std::optional<target::gdb::ClientPort> client_;
    std::optional<target::gdb::ProbeSession> session_;
};

}  // namespace test
