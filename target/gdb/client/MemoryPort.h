// MemoryPort: the memory of a stopped target through packets that its server can take.

#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "target/gdb/client/Connection.h"

namespace target::gdb {

class MemoryPort {
  public:
    /// A server's packets have room for at least one word.
    static constexpr std::size_t kPacketSizeMin = 0x20;

    explicit MemoryPort(Connection& connection) : connection_(connection) {}

    /// The longest packet that the server takes, frame included.
    void SetPacketSize(std::size_t size) { packetSize_ = size; }

    /// Lets "X" be used, where the server takes it and answers when it is done. Without that, "M"
    /// is used: it carries half as much.
    void AllowBinary(bool allowed) { binary_ = allowed ? Binary::Unknown : Binary::Refused; }

    /// `count` bytes in as few packets as possible, cut at multiples of 4. Four aligned bytes are
    /// always one access. A server may answer with less than was asked for; the rest is asked for
    /// then. Throws ProtocolError.
    std::string Read(std::uint32_t address, std::size_t count);
    void Write(std::uint32_t address, std::string_view bytes);

  private:
    enum class Binary { Unknown, Taken, Refused };

    void WriteHex(std::uint32_t address, std::string_view bytes);
    void WriteBinary(std::uint32_t address, std::string_view bytes);
    bool TakesBinary(std::uint32_t address);

    Connection& connection_;
    std::size_t packetSize_ = kPacketSizeMin;
    Binary binary_ = Binary::Refused;
};

}  // namespace target::gdb
