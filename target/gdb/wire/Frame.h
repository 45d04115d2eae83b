// Frames: how the GDB remote protocol puts packets, acknowledgements and interrupts on the wire.
// A packet is "$", its payload, "#" and a checksum of two digits; some bytes of the payload are
// escaped, and what a server sends may have runs of one byte shortened.

#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace target::gdb {

/// A longer payload, runs expanded, is no packet but damage.
inline constexpr std::size_t kPayloadMax = std::size_t{128} * 1024;

/// The characters around a payload, which count for a server's PacketSize.
inline constexpr std::size_t kFrameSize = 4;

inline constexpr char kInterrupt = '\x03';

/// The payload with frame and checksum; bytes that must not stand there are escaped already.
std::string Framed(std::string_view payload);

/// Whether that byte needs an escape in binary data, and so two characters.
bool NeedsEscape(char byte);
std::string Escaped(std::string_view bytes);

struct Frame {
    enum class Kind { Packet, Notification, Ack, Nak, Interrupt, Damaged };

    Kind kind;
    std::string payload;  ///< unescaped; of damage: what is wrong
};

/// Takes the bytes that have arrived, however they were cut, and gives the frames in them. Noise
/// between frames is skipped, and so are damaged notifications.
class FrameDecoder {
  public:
    /// A server shortens runs; a client doesn't, and may send the mark of a run as a plain byte.
    enum class Sender { Server, Client };

    explicit FrameDecoder(Sender sender) : sender_(sender) {}

    void Feed(std::string_view bytes);

    /// Nothing when the bytes so far hold no further whole frame.
    std::optional<Frame> Next();

  private:
    /// Between frames, inside of one, or at its checksum. A '$' inside of a payload begins a new
    /// frame: what came before was cut off. After damage the decoder is between frames again, and
    /// whoever feeds it asks for the packet once more.
    enum class State { Between, Payload, FirstDigit, SecondDigit };

    std::optional<Frame> Take(char byte);
    std::optional<Frame> TakeBetween(char byte);
    Frame Finish(char lastDigit);

    const Sender sender_;
    std::string arrived_;
    std::size_t taken_ = 0;  ///< of `arrived_`
    State state_ = State::Between;
    Frame::Kind kind_ = Frame::Kind::Packet;
    std::string raw_;
    bool tooLong_ = false;
    char firstDigit_ = 0;
};

}  // namespace target::gdb
