// Replies: what a server answers, each kind read by one function. A reply is whatever a server
// chose to send; nothing about it is taken for granted.

#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace target::gdb {

/// "E01" or "E.text".
bool IsError(std::string_view reply);

/// What an error says: the text behind "E.", or all of it.
std::string ErrorText(std::string_view reply);

/// An error, or the empty reply to a request that the server doesn't know.
bool IsRefusal(std::string_view reply);

/// Why the core isn't running, or what else a server says instead.
struct StopReply {
    enum class Kind {
        Stopped,  ///< by `signal`
        Exited,   ///< there is no program, or none any more
        Output,   ///< not stopped at all: `text` is output of the program or a command; empty to
                  ///< show that the server is at work
    };

    Kind kind;
    unsigned signal = 0;
    std::string text = {};
};

/// Nothing for a reply that is none of these.
std::optional<StopReply> ParseStopReply(std::string_view reply);

/// "SIGSEGV" for 11, or just the number.
std::string SignalName(unsigned signal);

/// What a server says that it can do.
struct Features {
    /// The longest packet that it takes, frame included.
    std::size_t packetSize = 400;
    bool noAckMode = false;
    bool nonStop = false;
    bool description = false;
};

/// Unknown features and malformed ones count for nothing. A PacketSize beyond what is worth
/// sending at once is cut down to that.
Features ParseFeatures(std::string_view reply);

/// The kinds of "vCont" that a server takes; an empty reply means none.
bool OffersContinue(std::string_view reply);

/// A piece of a document (qXfer): "m" and a piece before the last, "l" and the last.
struct DocumentPiece {
    bool last;
    std::string_view bytes;
};
std::optional<DocumentPiece> ParseDocumentPiece(std::string_view reply);

}  // namespace target::gdb
