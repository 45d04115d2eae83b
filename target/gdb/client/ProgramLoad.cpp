// The parts of GdbTarget that put a program into the target and make it ready to run.

#include <fmt/format.h>

#include <algorithm>

#include "base/ByteOrder.h"
#include "base/Hex.h"
#include "base/system/Paths.h"
#include "target/gdb/client/GdbTarget.h"
#include "target/gdb/client/LoaderFile.h"
#include "target/gdb/client/Texts.h"

namespace target::gdb {

namespace {

// A load has a fixed order: the file is read and found to fit before anything is written; then
// the mailbox as zeros (both blocks done), the segments, the comparison, and last the registers.
// After an error in between, RAM holds a part of a program and the registers don't lead there.
// The target is halted all the time, and a further load begins anew.

constexpr std::size_t kDocumentSizeMax = std::size_t{1} << 20;

// More than programs of this kind use.
constexpr std::uint32_t kStackBytes = 1024;

// Below that no compiled program gets far.
constexpr std::uint64_t kStackBytesMin = 64;

// The directory text was written for another system.
std::string LoaderPath(const GdbOptions& options, const std::string& fileName,
                       std::string directory) {
    if (!options.loader.empty()) return options.loader;
    std::replace(directory.begin(), directory.end(), '\\', '/');
    return base::NameOf(base::PathOf(directory + fileName).lexically_normal());
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
    const std::string path = LoaderPath(options_, fileName, directory);
    RequireFits(ReadLoaderFile(path), path);
}

/// The program lies in RAM, begins there and has room for a stack above it; its code and variables
/// aren't where it is spoken to. The memory for that may be segments of its own, without contents.
void GdbTarget::RequireFits(const LoaderFile& loader, const std::string& path) const {
    const std::uint64_t ramStart = options_.device.ramStart.value_or(0);
    const std::uint64_t ramEnd = ramEnd_ ? *ramEnd_ : std::uint64_t{1} << 32;
    const std::uint64_t first = options_.device.ramStart.value_or(mailbox_.address);
    const std::uint64_t end = std::uint64_t{mailbox_.address} + mailbox_.sizeBytes;
    std::uint64_t top = end;
    bool entered = false;
    for (const LoaderFile::Segment& segment : loader.segments) {
        const std::uint64_t segmentEnd = std::uint64_t{segment.address} + segment.bytes.size();
        const std::string range = fmt::format("{:#x}-{:#x}", segment.address, segmentEnd - 1);
        if (segment.address < ramStart || segmentEnd > ramEnd)
            RefuseLoader(path, fmt::format("has a segment at {}, outside the RAM ({:#x}-{:#x})",
                                           range, ramStart, ramEnd - 1));
        top = std::max(top, segmentEnd);
        const std::uint32_t entry = loader.entry & ~std::uint32_t{1};
        entered = entered || (entry >= segment.address && entry < segmentEnd);
        const bool outside = segmentEnd <= first || segment.address >= end;
        const bool reserved = segment.address >= first && segmentEnd <= end &&
                              segment.bytes.find_first_not_of('\0') == std::string::npos;
        if (!outside && !reserved)
            RefuseLoader(path, fmt::format("has a segment at {}, where its buffers and parameter "
                                           "blocks are ({:#x}-{:#x})",
                                           range, first, end - 1));
    }
    if (!entered)
        RefuseLoader(path, fmt::format("begins at {:#x}, where it has nothing", loader.entry));
    if (top + kStackBytesMin > ramEnd)
        RefuseLoader(path, fmt::format("leaves {} bytes for its stack, below {:#x}",
                                       ramEnd - std::min(top, ramEnd), ramEnd));
}

void GdbTarget::LoadSegments(const std::string& path) {
    const LoaderFile loader = ReadLoaderFile(path);
    RequireFits(loader, path);
    if (!ramEnd_)
        throw ProtocolError(
            "isn't asked: where the RAM ends isn't known; "
            "--gdb-option ram-end=ADDRESS tells it");
    mailboxBytes_.reset();
    memory_.Write(mailbox_.address, std::string(mailbox_.sizeBytes, '\0'));
    for (const LoaderFile::Segment& segment : loader.segments)
        memory_.Write(segment.address, segment.bytes);
    for (const LoaderFile::Segment& segment : loader.segments) {
        const std::string held = memory_.Read(segment.address, segment.bytes.size());
        const auto [there, wanted] = std::mismatch(held.begin(), held.end(), segment.bytes.begin());
        if (there != held.end())
            throw ProtocolError(fmt::format(
                "took the program, but {:#x} doesn't hold what was written there: is that RAM?",
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

std::vector<base::AddressRange> GdbTarget::MemoryOfProgram(const std::string& fileName,
                                                           const std::string& directory) const {
    const std::string path = LoaderPath(options_, fileName, directory);
    const LoaderFile loader = ReadLoaderFile(path);
    RequireFits(loader, path);
    std::vector<base::AddressRange> ranges{{options_.device.ramStart.value_or(mailbox_.address),
                                            mailbox_.address + mailbox_.sizeBytes - 1}};
    for (const LoaderFile::Segment& segment : loader.segments)
        if (!segment.bytes.empty())
            ranges.push_back({segment.address, segment.address + static_cast<std::uint32_t>(
                                                                     segment.bytes.size() - 1)});
    if (ramEnd_) ranges.push_back({*ramEnd_ - kStackBytes, *ramEnd_ - 1});
    return ranges;
}

const RegisterNumbers& GdbTarget::Registers() {
    if (registers_) return *registers_;
    if (!features_.description) return registers_.emplace();
    try {
        registers_ = ReadRegisterNumbers(
            [this](const std::string& document) { return ReadDocument(document); });
    } catch (const DescriptionError& error) {
        throw ProtocolError(fmt::format("can't be understood: {}", error.what()));
    }
    return *registers_;
}

unsigned GdbTarget::RegisterNumber(const std::string& name,
                                   const std::optional<std::uint32_t>& given) {
    if (given) return *given;
    const RegisterNumbers& numbers = Registers();
    if (!numbers.contains(name))
        throw ProtocolError(fmt::format(
            "doesn't tell the number of the register {0}; --gdb-option {0}=NUMBER does", name));
    return numbers.at(name);
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

std::string GdbTarget::Description() try {
    constexpr std::string_view kStart = "<architecture>";
    if (!features_.description || connection_.IsLost()) return "";
    const std::string document = ReadDocument("target.xml");
    const std::size_t start = document.find(kStart);
    const std::size_t end = document.find('<', start + 1);
    if (start == std::string::npos || end == std::string::npos) return "";
    return "architecture " +
           Shown(std::string_view(document).substr(0, end).substr(start + kStart.size()));
} catch (const ProtocolError&) {
    return "";
}

/// What the command puts out; in output packets, or as its reply.
std::string GdbTarget::Monitor(const std::string& command) {
    const std::string asked = fmt::format("the monitor command \"{}\"", Shown(command));
    const std::string reply = connection_.Ask("qRcmd," + base::ToHex(command));
    const std::string& output = connection_.Output();
    if (reply == "OK") return output;
    if (reply.empty()) throw ProtocolError("takes no monitor commands");
    if (IsError(reply))
        throw ProtocolError(
            fmt::format("answered \"{}\" to {}{}", ErrorText(reply), asked, LastLines(output)));
    const auto last = base::FromHex(reply);
    if (!last) connection_.Reject("qRcmd, " + command, reply);
    return output + *last;
}

}  // namespace target::gdb
