// What may be written, and temporary files that are renamed when they are whole.

#include "host/files/OutputFile.h"

#include <fmt/format.h>

#include <cerrno>
#include <chrono>
#include <optional>
#include <thread>

#include "base/system/Files.h"
#include "base/system/Paths.h"
#include "base/system/Signals.h"
#include "base/system/StandardStreams.h"
#include "host/base/Interrupt.h"
#include "host/files/Streams.h"

namespace host {

namespace {

std::string DirectoryOf(const std::string& path) {
    const std::string directory = base::NameOf(base::PathOf(path).parent_path());
    return directory.empty() ? "." : directory;
}

/// The file behind all links; nothing when there is none. Failure when that can't be told.
std::optional<base::FileStatus> Look(const FileKind& kind, const std::string& path) {
    auto status = base::StatusOf(path);
    if (!status && errno != ENOENT) throw FileFailure(kind, "write", path, errno);
    return status;
}

bool IsRegular(const std::optional<base::FileStatus>& file) {
    return file && file->type == base::FileType::Regular;
}

bool IsStandardInput(const base::FileStatus& file) {
    const auto input = base::StatusOf(base::kStandardInput);
    return input && base::IsSameFile(*input, file);
}

/// What a temporary file adds to the name of its target, before six letters and digits.
constexpr char kTemporary[] = ".corvane-";

class TemporaryFile {
  public:
    TemporaryFile(const FileKind& kind, std::string target)
        : kind_(kind), target_(std::move(target)), path_(target_ + kTemporary + "XXXXXX") {
        file_ = base::OpenTemporary(path_);
        if (!file_.IsOpen()) Fail();
    }
    ~TemporaryFile() {
        if (!renamed_) base::Remove(path_);
    }
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;

    void Write(std::string_view contents, const std::optional<base::FileStatus>& old) {
        errno = WriteAll(file_.Get(), contents);
        if (errno != 0) Fail();
        base::TakeOver(file_.Get(), old);
        if (!base::Sync(file_.Get()) || !file_.Close()) Fail();
    }

    void Rename(Existing existing) {
        renamed_ = existing == Existing::Replace ? base::RenameOver(path_, target_)
                                                 : base::RenameToNew(path_, target_);
        if (!renamed_) Fail();
    }

  private:
    [[noreturn]] void Fail() const { throw FileFailure(kind_, "write", target_, errno); }

    const FileKind& kind_;
    const std::string target_;
    std::string path_;
    const base::SignalsHeld held_;
    base::Descriptor file_;
    bool renamed_ = false;
};

void WriteInto(const FileKind& kind, const std::string& path, std::string_view contents) {
    base::Descriptor file = OpenForWriting(kind, path);
    const int error = WriteAll(file.Get(), contents);
    if (error == EINTR) ThrowIfInterrupted();
    if (error != 0) throw FileFailure(kind, "write", path, error);
    if (!file.Close()) throw FileFailure(kind, "write", path, errno);
}

}  // namespace

void RequireWritable(const FileKind& kind, const std::string& path, Existing existing) {
    const auto status = Look(kind, path);
    if (!status && !base::MayWrite(DirectoryOf(base::FollowLinks(path))))
        throw FileFailure(kind, "write", path, errno);
    if (!IsRegular(status)) return;
    if (IsStandardInput(*status))
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{} can't be written: it is the file that standard input comes "
                                  "from; name another one",
                                  path));
    if (existing == Existing::Keep)
        throw Failure(ExitStatus::WrongUsage, path + " exists; overwrite it with --force");
    // The superuser may write everything, but whoever took the permission away meant it.
    if (status->readOnly || !base::MayWrite(path))
        throw FileFailure(kind, "write", path, "it is read-only");
}

void WriteWholeFile(const FileKind& kind, const std::string& path, std::string_view contents,
                    Existing existing) {
    RequireWritable(kind, path, existing);
    const auto old = Look(kind, path);
    if (old && !IsRegular(old)) return WriteInto(kind, path, contents);
    TemporaryFile file(kind, base::FollowLinks(path));
    file.Write(contents, old);
    file.Rename(existing);
}

void RemoveLeftovers(const std::string& path) {
    const std::string target = base::FollowLinks(path);
    const std::string directory = DirectoryOf(target);
    const std::string beginning = base::NameOf(base::PathOf(target).filename()) + kTemporary;
    for (const std::string& name : base::RegularFilesIn(directory))
        if (name.starts_with(beginning) && name.size() == beginning.size() + 6)
            base::Remove(fmt::format("{}/{}", directory, name));
}

base::Descriptor OpenForWriting(const FileKind& kind, const std::string& path) {
    constexpr std::chrono::milliseconds kBetweenLooks{50};
    for (;; std::this_thread::sleep_for(kBetweenLooks)) {
        ThrowIfInterrupted();
        base::Descriptor file = base::OpenToWrite(path);
        if (file.IsOpen()) return file;
        const int error = errno;
        const auto status = Look(kind, path);
        const bool waitsForReader =
            error == ENXIO && status && status->type == base::FileType::Pipe;
        if (!waitsForReader) throw FileFailure(kind, "write", path, error);
    }
}

}  // namespace host
