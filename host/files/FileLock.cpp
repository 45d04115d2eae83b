// The holder removes the lock file before it lets go. Whoever gets a lock then looks whether the
// file that it has locked is still the one of that name, and else begins again.

#include "host/files/FileLock.h"

#include <fcntl.h>
#include <fmt/format.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <chrono>
#include <filesystem>
#include <string_view>
#include <thread>

#include "host/base/Interrupt.h"
#include "host/files/OutputFile.h"
#include "host/files/Streams.h"

namespace host {

namespace {

namespace fs = std::filesystem;

using Clock = std::chrono::steady_clock;

constexpr std::chrono::seconds kPatience{10};
constexpr std::chrono::milliseconds kLook{20};

bool IsStillThere(const base::Descriptor& file, const std::string& path) {
    struct stat locked {};
    struct stat named {};
    return fstat(file.Get(), &locked) == 0 && stat(path.c_str(), &named) == 0 &&
           locked.st_dev == named.st_dev && locked.st_ino == named.st_ino;
}

/// What a lock file holds: somebody may have another file of that name.
constexpr std::string_view kMark = "A lock of corvane-flash\n";

bool HoldsMark(const base::Descriptor& file) {
    std::array<char, kMark.size() + 1> text{};
    const ssize_t count = pread(file.Get(), text.data(), text.size(), 0);
    return count > 0 && std::string_view(text.data(), static_cast<std::size_t>(count)) == kMark;
}

enum class Attempt { Locked, Busy, Impossible };

/// Makes the lock file, or opens the one that is there.
base::Descriptor OpenLock(const std::string& path, bool& made) {
    base::Descriptor file(
        open(path.c_str(), O_RDWR | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0666));
    made = file.IsOpen();
    if (made) WriteAll(file.Get(), kMark);
    if (made || errno != EEXIST) return file;
    return base::Descriptor(open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
}

Attempt TryLock(base::Descriptor& file, const std::string& path, bool& made) {
    for (;;) {
        file = OpenLock(path, made);
        const bool gone = !file.IsOpen() && errno == ENOENT;
        if (gone && access(fs::path(path).parent_path().c_str(), F_OK) == 0) continue;
        if (!file.IsOpen()) return Attempt::Impossible;
        if (flock(file.Get(), LOCK_EX | LOCK_NB) != 0) {
            const bool busy = errno == EWOULDBLOCK;
            file = base::Descriptor();
            return busy ? Attempt::Busy : Attempt::Impossible;
        }
        if (IsStillThere(file, path)) return Attempt::Locked;
    }
}

}  // namespace

std::string LockPath(const std::string& path) {
    std::error_code error;
    const fs::path file = fs::weakly_canonical(FollowLinks(path), error);
    return error || file.empty() ? "" : fs::absolute(file).string() + ".lock";
}

FileLock::FileLock(const FileKind& kind, const std::string& path, const WaitNotice& say)
    : path_(LockPath(path)) {
    if (path_.empty()) return;
    const auto start = Clock::now();
    for (bool said = false; TryLock(file_, path_, made_) == Attempt::Busy; said = true) {
        ThrowIfInterrupted();
        if (!said)
            say(fmt::format("another run uses the {} {}; waiting up to {} s", kind.name, path,
                            kPatience.count()));
        if (Clock::now() - start >= kPatience)
            throw FileBusy(kind.unusable,
                           fmt::format("another run has been using the {} {} for {} s; try again "
                                       "when it has ended",
                                       kind.name, path, kPatience.count()));
        std::this_thread::sleep_for(kLook);
    }
    if (file_.IsOpen()) RemoveLeftovers(path);
}

FileLock::~FileLock() {
    if (!file_.IsOpen() || !IsStillThere(file_, path_)) return;
    if (made_ || HoldsMark(file_)) unlink(path_.c_str());
}

}  // namespace host
