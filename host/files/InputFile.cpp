// Opening without waiting for a writer, reading whenever there is something.

#include "host/files/InputFile.h"

#include <fmt/format.h>

#include <algorithm>
#include <cerrno>
#include <span>
#include <utility>

#include "base/system/ErrorText.h"
#include "base/system/Files.h"
#include "base/system/StandardStreams.h"
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

/// Standard input keeps its mode, which belongs to others as well.
base::Descriptor Open(const FileKind& kind, const std::string& path) {
    base::Descriptor file = IsStandardInput(kind, path) ? base::Duplicate(base::kStandardInput)
                                                        : base::OpenToRead(path);
    if (!file.IsOpen()) throw FileFailure(kind, "read", path, errno);
    return file;
}

/// The size of a regular file; 0 of everything that doesn't know its own.
std::uint64_t KnownSize(const base::Descriptor& file) {
    const auto status = base::StatusOf(file.Get());
    return status && status->type == base::FileType::Regular ? status->sizeBytes : 0;
}

}  // namespace

Failure FileFailure(const FileKind& kind, const char* doing, const std::string& path,
                    const std::string& why) {
    return {kind.unusable,
            fmt::format("can't {} the {} {}: {}", doing, kind.name,
                        IsStandardInput(kind, path) ? "on standard input" : path, why)};
}

Failure FileFailure(const FileKind& kind, const char* doing, const std::string& path, int error) {
    return FileFailure(kind, doing, path, base::ErrorText(error));
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
        if (!WaitUntilReady(file_.Get(), base::Ready::ToRead)) continue;
        contents_.resize(had + wanted);
        const auto count = base::ReadFrom(file_.Get(), std::span(contents_).subspan(had));
        const int error = errno;
        contents_.resize(had + count.value_or(0));
        ended_ = count == 0U;
        if (!count && error != EAGAIN) throw FileFailure(kind_, "read", path_, error);
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
