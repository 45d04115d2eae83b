// What may be written, and temporary files that are renamed when they are whole.

#include "host/files/OutputFile.h"

#include <fcntl.h>
#include <fmt/format.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstdio>
#include <filesystem>
#include <optional>
#include <thread>

#include "host/base/Interrupt.h"
#include "host/files/Streams.h"

namespace host {

namespace {

namespace fs = std::filesystem;

std::string DirectoryOf(const std::string& path) {
    const std::string directory = fs::path(path).parent_path().string();
    return directory.empty() ? "." : directory;
}

/// The file behind all links; nothing when there is none. Failure when that can't be told.
std::optional<struct stat> Look(const FileKind& kind, const std::string& path) {
    struct stat status {};
    if (stat(path.c_str(), &status) == 0) return status;
    if (errno != ENOENT) throw FileFailure(kind, "write", path, errno);
    return std::nullopt;
}

bool IsStandardInput(const struct stat& file) {
    struct stat input {};
    return fstat(STDIN_FILENO, &input) == 0 && input.st_dev == file.st_dev &&
           input.st_ino == file.st_ino;
}

/// The permissions of a file that is created without any wish of its own.
mode_t DefaultMode() {
    const mode_t mask = umask(0);
    umask(mask);
    return static_cast<mode_t>(0666 & ~mask);
}

/// Renames where nothing may be replaced; in one step, so that nothing can come in between.
bool RenameToNew(const char* from, const char* to) {
    if (renameat2(AT_FDCWD, from, AT_FDCWD, to, RENAME_NOREPLACE) == 0) return true;
    // Some file systems know no such renaming, but links.
    return errno == EINVAL && link(from, to) == 0 && unlink(from) == 0;
}

/// What a temporary file adds to the name of its target, before six letters and digits.
constexpr char kTemporary[] = ".corvane-";

class TemporaryFile {
  public:
    TemporaryFile(const FileKind& kind, std::string target)
        : kind_(kind), target_(std::move(target)), path_(target_ + kTemporary + "XXXXXX") {
        file_ = base::Descriptor(mkostemp(path_.data(), O_CLOEXEC));
        if (!file_.IsOpen()) Fail();
    }
    ~TemporaryFile() {
        if (!renamed_) unlink(path_.c_str());
    }
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;

    void Write(std::string_view contents, const std::optional<struct stat>& old) {
        errno = WriteAll(file_.Get(), contents);
        if (errno != 0) Fail();
        // Only the superuser may give files away; for others the new file is theirs.
        if (old) static_cast<void>(!fchown(file_.Get(), old->st_uid, old->st_gid));
        fchmod(file_.Get(), old ? old->st_mode & 0777 : DefaultMode());
        if (fsync(file_.Get()) != 0 || !file_.Close()) Fail();
    }

    void Rename(Existing existing) {
        renamed_ = existing == Existing::Replace ? std::rename(path_.c_str(), target_.c_str()) == 0
                                                 : RenameToNew(path_.c_str(), target_.c_str());
        if (!renamed_) Fail();
        // The name lies in the directory. Where that can't be synced, the file is whole all the
        // same, the old one or the new one.
        const base::Descriptor directory(open(DirectoryOf(target_).c_str(), O_RDONLY | O_CLOEXEC));
        if (directory.IsOpen()) fsync(directory.Get());
    }

  private:
    [[noreturn]] void Fail() const { throw FileFailure(kind_, "write", target_, errno); }

    const FileKind& kind_;
    const std::string target_;
    std::string path_;
    const SignalsHeld held_;
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

std::string FollowLinks(const std::string& path) {
    constexpr int kLinksMax = 40;  // as the kernel has it
    std::error_code ignored;
    fs::path target = path;
    for (int i = 0; i < kLinksMax && fs::is_symlink(target, ignored); ++i)
        target = target.parent_path() / fs::read_symlink(target, ignored);
    return target.string();
}

void RequireWritable(const FileKind& kind, const std::string& path, Existing existing) {
    const auto status = Look(kind, path);
    if (!status && access(DirectoryOf(FollowLinks(path)).c_str(), W_OK) != 0)
        throw FileFailure(kind, "write", path, errno);
    if (!status || !S_ISREG(status->st_mode)) return;
    if (IsStandardInput(*status))
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{} can't be written: it is the file that standard input comes "
                                  "from; name another one",
                                  path));
    if (existing == Existing::Keep)
        throw Failure(ExitStatus::WrongUsage, path + " exists; overwrite it with --force");
    // The superuser may write everything, but whoever took the permission away meant it.
    if ((status->st_mode & 0222) == 0 || access(path.c_str(), W_OK) != 0)
        throw FileFailure(kind, "write", path, "it is read-only");
}

void WriteWholeFile(const FileKind& kind, const std::string& path, std::string_view contents,
                    Existing existing) {
    RequireWritable(kind, path, existing);
    const auto old = Look(kind, path);
    if (old && !S_ISREG(old->st_mode)) return WriteInto(kind, path, contents);
    TemporaryFile file(kind, FollowLinks(path));
    file.Write(contents, old);
    file.Rename(existing);
}

void RemoveLeftovers(const std::string& path) {
    const fs::path target = FollowLinks(path);
    const std::string beginning = target.filename().string() + kTemporary;
    std::error_code ignored;
    for (const fs::directory_entry& entry : fs::directory_iterator(DirectoryOf(target), ignored)) {
        const std::string name = entry.path().filename().string();
        const bool isOurs = name.starts_with(beginning) && name.size() == beginning.size() + 6;
        if (isOurs && entry.symlink_status(ignored).type() == fs::file_type::regular)
            fs::remove(entry.path(), ignored);
    }
}

base::Descriptor OpenForWriting(const FileKind& kind, const std::string& path) {
    constexpr std::chrono::milliseconds kBetweenLooks{50};
    for (;; std::this_thread::sleep_for(kBetweenLooks)) {
        ThrowIfInterrupted();
        base::Descriptor file(
            open(path.c_str(), O_WRONLY | O_CREAT | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, 0666));
        if (file.IsOpen()) return file;
        const int error = errno;
        const auto status = Look(kind, path);
        const bool waitsForReader = error == ENXIO && status && S_ISFIFO(status->st_mode);
        if (!waitsForReader) throw FileFailure(kind, "write", path, error);
    }
}

}  // namespace host
