// Opening without waiting for a writer, reading whenever there is something.

#include "host/files/InputFile.h"

#include <fcntl.h>
#include <fmt/format.h>
#include <poll.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <system_error>
#include <utility>

#include "host/base/Interrupt.h"
#include "host/base/Text.h"
#include "host/files/Streams.h"

namespace host {

namespace {

constexpr std::size_t kBeginningBytes = std::size_t{64} << 10;
constexpr std::size_t kPieceBytes = std::size_t{256} << 10;

bool IsStandardInput(const FileKind& kind, const std::string& path) {
    return kind.fromStandardInput && path == "-";
}

/// Blocking is what O_NONBLOCK prevents: the open of a pipe would wait for its writer. Standard
/// input keeps its mode, which belongs to others as well.
base::Descriptor Open(const FileKind& kind, const std::string& path) {
    const int file = IsStandardInput(kind, path)
                         ? fcntl(STDIN_FILENO, F_DUPFD_CLOEXEC, 3)
                         : open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
    if (file < 0) throw FileFailure(kind, "read", path, errno);
    return base::Descriptor(file);
}

/// The size of a regular file; 0 of everything that doesn't know its own.
std::uint64_t KnownSize(const base::Descriptor& file) {
    struct stat status {};
    const bool known = fstat(file.Get(), &status) == 0 && S_ISREG(status.st_mode);
    return known ? static_cast<std::uint64_t>(status.st_size) : 0;
}

}  // namespace

Failure FileFailure(const FileKind& kind, const char* doing, const std::string& path,
                    const std::string& why) {
    return {kind.unusable,
            fmt::format("can't {} the {} {}: {}", doing, kind.name,
                        IsStandardInput(kind, path) ? "on standard input" : path, why)};
}

Failure FileFailure(const FileKind& kind, const char* doing, const std::string& path, int error) {
    return FileFailure(kind, doing, path, std::generic_category().message(error));
}

InputFile::InputFile(const FileKind& kind, const std::string& path)
    : kind_(kind), path_(path), file_(Open(kind, path)) {}

const std::string& InputFile::Beginning() {
    ReadUntil(kBeginningBytes);
    return contents_;
}

std::string InputFile::Contents(std::uint64_t maxBytes) {
    const std::uint64_t size = KnownSize(file_);
    if (size > maxBytes) FailTooLarge(maxBytes);
    contents_.reserve(size + 1);
    ReadUntil(maxBytes + 1);
    if (contents_.size() > maxBytes) FailTooLarge(maxBytes);
    return std::move(contents_);
}

void InputFile::ReadUntil(std::uint64_t bytes) {
    while (!ended_ && contents_.size() < bytes) {
        ThrowIfInterrupted();
        const std::size_t had = contents_.size();
        const std::size_t wanted = std::min<std::uint64_t>(kPieceBytes, bytes - had);
        if (!WaitUntilReady(file_.Get(), POLLIN)) continue;
        contents_.resize(had + wanted);
        const ssize_t count = read(file_.Get(), contents_.data() + had, wanted);
        const int error = errno;
        contents_.resize(had + static_cast<std::size_t>(std::max<ssize_t>(count, 0)));
        ended_ = count == 0;
        if (count < 0 && error != EINTR && error != EAGAIN)
            throw FileFailure(kind_, "read", path_, error);
    }
}

void InputFile::FailTooLarge(std::uint64_t maxBytes) const {
    throw FileFailure(
        kind_, "read", path_,
        fmt::format("it is larger than {}, and no {} is", SizeText(maxBytes), kind_.name));
}

std::string ReadWholeFile(const FileKind& kind, const std::string& path) {
    return InputFile(kind, path).Contents(kind.maxBytes);
}

}  // namespace host
