// The parts of GdbTarget that put a program into the target and make it ready to run.

#include <fmt/format.h>

#include <algorithm>
#include <filesystem>

#include "base/ByteOrder.h"
#include "base/Hex.h"
#include "target/gdb/client/GdbTarget.h"
#include "target/gdb/client/LoaderFile.h"

namespace target::gdb {

namespace {

constexpr std::size_t kDocumentSizeMax = std::size_t{1} << 20;
constexpr std::size_t kMonitorOutputMax = std::size_t{64} << 10;

// The directory text was written for another system.
std::string LoaderPath(const GdbOptions& options, const std::string& fileName,
                       std::string directory) {
    if (!options.loader.empty()) return options.loader;
    std::replace(directory.begin(), directory.end(), '\\', '/');
    return std::filesystem::path(directory + fileName).lexically_normal().string();
}

}  // namespace

void GdbTarget::LoadProgram(const std::string& fileName, const std::string& directory) {
    const std::string path = LoaderPath(options_, fileName, directory);
    Perform([&] { return fmt::format("Loading the program {}", path); },
            [&] {
                if (started_)
                    throw ProtocolError("isn't asked: the target is running; halt it first");
                LoadSegments(path);
            });
}

void GdbTarget::RequireProgram(const std::string& fileName, const std::string& directory) {
    ReadLoaderFile(LoaderPath(options_, fileName, directory));
}

void GdbTarget::LoadSegments(const std::string& path) {
    const LoaderFile loader = ReadLoaderFile(path);
    if (!ramEnd_)
        throw ProtocolError(
            "isn't asked: where the RAM ends isn't known; "
            "--gdb-option ram-end=ADDRESS tells it");
    look_.reset();
    memory_.Write(mailbox_.address, std::string(mailbox_.sizeBytes, '\0'));
    for (const LoaderFile::Segment& segment : loader.segments)
        memory_.Write(segment.address, segment.bytes);
    for (const LoaderFile::Segment& segment : loader.segments) {
        const std::string held = memory_.Read(segment.address, segment.bytes.size());
        const auto [there, wanted] = std::mismatch(held.begin(), held.end(), segment.bytes.begin());
        if (there != held.end())
            throw ProtocolError(fmt::format(
                "took the program, but 0x{:08X} doesn't hold what was written there: is that RAM?",
                segment.address + static_cast<std::uint32_t>(there - held.begin())));
    }
    WriteRegister(RegisterNumber("sp", options_.sp), *ramEnd_);
    // An odd entry point means Thumb code. A core that notes this in its status register wants it
    // there, too: it has taken it from the reset vector, which may be erased or zero.
    const bool thumb = loader.entry % 2 != 0;
    if (thumb && registers_ && registers_->contains("xpsr"))
        WriteRegister(registers_->at("xpsr"), 0x01000000);
    WriteRegister(RegisterNumber("pc", options_.pc), loader.entry & ~std::uint32_t{1});
}

unsigned GdbTarget::RegisterNumber(const std::string& name,
                                   const std::optional<std::uint32_t>& given) {
    if (given) return *given;
    if (!registers_ && features_.description) {
        try {
            registers_ = ReadRegisterNumbers(
                [this](const std::string& document) { return ReadDocument(document); });
        } catch (const DescriptionError& error) {
            throw ProtocolError(fmt::format("can't be understood: {}", error.what()));
        }
    }
    if (!registers_ || !registers_->contains(name))
        throw ProtocolError(fmt::format(
            "doesn't tell the number of the register {0}; --gdb-option {0}=NUMBER does", name));
    return registers_->at(name);
}

void GdbTarget::WriteRegister(unsigned number, std::uint32_t value) {
    connection_.RequireOk(fmt::format("P{:x}={}", number, base::ToHex(base::WordBytes(value))));
}

std::string GdbTarget::ReadDocument(const std::string& name) {
    const std::size_t pieceSize = features_.packetSize - kFrameSize - 1;
    std::string document;
    for (;;) {
        const std::string request =
            fmt::format("qXfer:features:read:{}:{:x},{:x}", name, document.size(), pieceSize);
        const std::string reply = connection_.Ask(request);
        const auto piece = ParseDocumentPiece(reply);
        if (!piece) connection_.Reject(request, reply);
        document += piece->bytes;
        if (piece->last) return document;
        if (piece->bytes.empty() || document.size() > kDocumentSizeMax)
            throw ProtocolError(fmt::format("sends its document {} without end", name));
    }
}

std::string GdbTarget::Monitor(const std::string& command) {
    const std::string asked = fmt::format("the monitor command \"{}\"", Shown(command));
    std::string output;
    std::string reply = connection_.Ask("qRcmd," + base::ToHex(command));
    Deadline deadline = After(connection_.Timeout());
    for (;;) {
        const auto line = ParseStopReply(reply);
        const auto last = base::FromHex(reply);
        if (reply == "OK") return output;
        if (reply.empty()) throw ProtocolError("takes no monitor commands");
        if (IsError(reply))
            throw ProtocolError(fmt::format("answered \"{}\" to {}{}{}", Shown(reply), asked,
                                            output.empty() ? "" : ": ", Shown(output)));
        if (last) return output + *last;
        if (!line) throw ProtocolError(fmt::format("answered \"{}\" to {}", Shown(reply), asked));
        if (output.size() < kMonitorOutputMax) output += line->text;
        auto next = connection_.Receive(deadline);
        if (!next) connection_.Lose(fmt::format("didn't end {} in time", asked));
        reply = std::move(*next);
    }
}

}  // namespace target::gdb
