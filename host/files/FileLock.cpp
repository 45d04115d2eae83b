// The holder removes the lock file before it lets go. Whoever gets a lock then looks whether the
// file that it has locked is still the one of that name, and else begins again.

#include "host/files/FileLock.h"

#include <fcntl.h>
#include <fmt/format.h>
#include <sys/file.h>
#include <sys/stat.h>

#include <cerrno>
#include <chrono>
#include <filesystem>
#include <thread>

#include "host/base/Interrupt.h"
#include "host/files/OutputFile.h"

namespace host {

namespace {

using Clock = std::chrono::steady_clock;

constexpr std::chrono::seconds kPatience{10};
constexpr std::chrono::milliseconds kLook{20};

bool IsStillThere(const base::Descriptor& file, const std::string& path) {
    struct stat locked {};
    struct stat named {};
    return fstat(file.Get(), &locked) == 0 && stat(path.c_str(), &named) == 0 &&
           locked.st_dev == named.st_dev && locked.st_ino == named.st_ino;
}

/// Somebody may have a file of that name which is no lock of ours.
bool IsEmptyFile(const base::Descriptor& file) {
    struct stat status {};
    return fstat(file.Get(), &status) == 0 && S_ISREG(status.st_mode) && status.st_size == 0;
}

enum class Attempt { Locked, Busy, Impossible };

Attempt TryLock(base::Descriptor& file, const std::string& path) {
    for (;;) {
        file = base::Descriptor(
            open(path.c_str(), O_RDONLY | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC, 0666));
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
    std::error_code ignored;
    return std::filesystem::weakly_canonical(FollowLinks(path), ignored).string() + ".lock";
}

FileLock::FileLock(const FileKind& kind, const std::string& path, const WaitNotice& say)
    : path_(LockPath(path)) {
    const auto start = Clock::now();
    for (bool said = false; TryLock(file_, path_) == Attempt::Busy; said = true) {
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
}

FileLock::~FileLock() {
    if (file_.IsOpen() && IsEmptyFile(file_) && IsStillThere(file_, path_)) unlink(path_.c_str());
}

}  // namespace host
