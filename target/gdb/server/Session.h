// Session: a client's requests to a device, answered. It sees payloads only, so that it can be
// driven without a connection.

#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "target/gdb/server/ServedDevice.h"
#include "target/gdb/wire/Requests.h"

namespace target::gdb {

/// Receives the text of a request that the device refused.
using ComplaintSink = std::function<void(const std::string& text)>;

class Session {
  public:
    /// The longest packet that is taken, frame included, as told to clients.
    static constexpr std::size_t kPacketSize = 0x4000;

    Session(ServedDevice& device, ComplaintSink complain)
        : device_(device), complain_(std::move(complain)) {}

    /// The payloads to send in reply, in order; none for what is answered when the target stops.
    std::vector<std::string> Answer(std::string_view payload);

    /// Stops the target. The stop reply, if a client waits for one.
    std::vector<std::string> Interrupt();

    bool AcknowledgesPackets() const { return acknowledges_; }
    bool HasEnded() const { return ended_; }

  private:
    std::vector<std::string> Carry(const Request& request);
    void GoTo(const Request& request);
    std::string ReadMemory(const Request& request);
    std::string WriteMemory(const Request& request);
    std::string Checksum(const Request& request);
    std::string ReadDocument(const Request& request) const;
    std::string ReadRegister(const Request& request);
    std::string WriteRegister(const Request& request);
    std::string WriteRegisters(const Request& request);
    std::vector<std::string> Monitor(const std::string& command);
    std::string Refuse(const std::string& why);

    ServedDevice& device_;
    const ComplaintSink complain_;
    bool acknowledges_ = true;
    bool awaitsStop_ = false;  ///< the client: it has let the target run
    bool ended_ = false;
};

}  // namespace target::gdb
