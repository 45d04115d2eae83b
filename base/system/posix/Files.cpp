// Files of the C library.

#include "base/system/Files.h"

#include <fcntl.h>
#include <limits.h>
#include <poll.h>
#include <stdlib.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <filesystem>

namespace base {

namespace {

namespace fs = std::filesystem;

FileType TypeOf(mode_t mode) {
    if (S_ISREG(mode)) return FileType::Regular;
    if (S_ISFIFO(mode)) return FileType::Pipe;
    return S_ISCHR(mode) ? FileType::CharacterDevice : FileType::Other;
}

FileStatus Translate(const struct stat& status) {
    return {TypeOf(status.st_mode),
            static_cast<std::uint64_t>(status.st_size),
            status.st_dev,
            status.st_ino,
            status.st_nlink,
            status.st_mode & 0777,
            status.st_uid,
            status.st_gid,
            (status.st_mode & 0222) == 0};
}

std::optional<std::size_t> Transferred(ssize_t bytes) {
    if (bytes >= 0) return static_cast<std::size_t>(bytes);
    if (errno == EINTR) errno = EAGAIN;
    return std::nullopt;
}

/// The permissions of a file that is created without any wish of its own.
mode_t DefaultPermissions() {
    const mode_t mask = umask(0);
    umask(mask);
    return static_cast<mode_t>(0666 & ~mask);
}

/// A name lies in its directory. Where that can't be synced, the file is whole all the same, the
/// old one or the new one.
void SyncDirectoryOf(const std::string& path) {
    const std::size_t slash = path.rfind('/');
    const std::string directory = slash == std::string::npos ? "." : path.substr(0, slash + 1);
    const Descriptor opened(open(directory.c_str(), O_RDONLY | O_CLOEXEC));
    if (opened.IsOpen()) fsync(opened.Get());
}

}  // namespace

bool Descriptor::Close() {
    return !IsOpen() || close(std::exchange(number_, -1)) == 0;
}

std::optional<FileStatus> StatusOf(const std::string& path) {
    struct stat status {};
    if (stat(path.c_str(), &status) != 0) return std::nullopt;
    return Translate(status);
}

std::optional<FileStatus> StatusOf(int file) {
    struct stat status {};
    if (fstat(file, &status) != 0) return std::nullopt;
    return Translate(status);
}

std::string FollowLinks(const std::string& path) {
    constexpr int kLinksMax = 40;  // as the kernel has it
    std::error_code ignored;
    fs::path target = path;
    for (int i = 0; i < kLinksMax && fs::is_symlink(target, ignored); ++i)
        target = target.parent_path() / fs::read_symlink(target, ignored);
    return target.string();
}

std::string CanonicalPath(const std::string& path) {
    std::error_code error;
    const fs::path full = fs::absolute(FollowLinks(path), error);
    const fs::path canonical = error ? fs::path() : fs::weakly_canonical(full, error);
    return error ? "" : canonical.string();
}

std::vector<std::string> RegularFilesIn(const std::string& directory) {
    std::vector<std::string> names;
    std::error_code error;
    std::error_code ignored;
    for (fs::directory_iterator each(directory, error), end; !error && each != end;
         each.increment(error))
        if (each->symlink_status(ignored).type() == fs::file_type::regular)
            names.push_back(each->path().filename().string());
    return names;
}

bool IsSameFile(const FileStatus& one, const FileStatus& other) {
    return one.device == other.device && one.number == other.number;
}

bool MayWrite(const std::string& path) {
    return access(path.c_str(), W_OK) == 0;
}

Descriptor OpenToRead(const std::string& path) {
    return Descriptor(open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
}

Descriptor OpenToWrite(const std::string& path) {
    return Descriptor(
        open(path.c_str(), O_WRONLY | O_CREAT | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, 0666));
}

Descriptor OpenNew(const std::string& path) {
    return Descriptor(open(path.c_str(), O_RDWR | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0666));
}

Descriptor OpenBehindNoLink(const std::string& path) {
    return Descriptor(open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
}

Descriptor OpenTemporary(std::string& path) {
    return Descriptor(mkostemp(path.data(), O_CLOEXEC));
}

bool AwaitFile(int file, Ready ready, std::chrono::milliseconds time) {
    pollfd waited{file, static_cast<short>(ready == Ready::ToRead ? POLLIN : POLLOUT), 0};
    return poll(&waited, 1, static_cast<int>(time.count())) > 0;
}

std::optional<std::size_t> ReadFrom(int file, std::span<char> room) {
    return Transferred(read(file, room.data(), room.size()));
}

std::optional<std::size_t> WriteTo(int file, std::string_view bytes) {
    // A pipe that is ready takes this much without blocking, whatever its mode.
    return Transferred(write(file, bytes.data(), std::min<std::size_t>(bytes.size(), PIPE_BUF)));
}

std::optional<std::size_t> ReadBeginning(int file, std::span<char> room) {
    return Transferred(pread(file, room.data(), room.size(), 0));
}

bool MakeEmpty(int file) {
    return ftruncate(file, 0) == 0;
}

LockState TryLock(int file) {
    if (flock(file, LOCK_EX | LOCK_NB) == 0) return LockState::Locked;
    return errno == EWOULDBLOCK ? LockState::Busy : LockState::Impossible;
}

void TakeOver(int file, const std::optional<FileStatus>& old) {
    // Only the superuser may give files away; for others the new file is theirs.
    if (old) static_cast<void>(!fchown(file, old->owner, old->group));
    fchmod(file, old ? old->permissions : DefaultPermissions());
}

bool Sync(int file) {
    return fsync(file) == 0;
}

bool RenameOver(const std::string& from, const std::string& to) {
    if (std::rename(from.c_str(), to.c_str()) != 0) return false;
    SyncDirectoryOf(to);
    return true;
}

bool RenameToNew(const std::string& from, const std::string& to) {
    const bool renamed =
        renameat2(AT_FDCWD, from.c_str(), AT_FDCWD, to.c_str(), RENAME_NOREPLACE) == 0 ||
        // Some file systems know no such renaming, but links.
        (errno == EINVAL && link(from.c_str(), to.c_str()) == 0 && unlink(from.c_str()) == 0);
    if (renamed) SyncDirectoryOf(to);
    return renamed;
}

bool Remove(const std::string& path) {
    return unlink(path.c_str()) == 0;
}

}  // namespace base
