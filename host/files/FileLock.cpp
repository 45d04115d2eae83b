// The holder removes the lock file before it lets go. Whoever gets a lock then looks whether the
// file that it has locked is still the one of that name, and else begins again.

#include "host/files/FileLock.h"

#include <fmt/format.h>

#include <array>
#include <cerrno>
#include <chrono>
#include <string_view>
#include <thread>
#include <utility>

#include "base/system/Files.h"
#include "base/system/Paths.h"
#include "host/base/Interrupt.h"
#include "host/files/OutputFile.h"
#include "host/files/Streams.h"

namespace host {

namespace {

using Clock = std::chrono::steady_clock;

constexpr std::chrono::seconds kPatience{10};
constexpr std::chrono::milliseconds kLook{20};

bool IsStillThere(const base::Descriptor& file, const std::string& path) {
    const auto locked = base::StatusOf(file.Get());
    const auto named = base::StatusOf(path);
    return locked && named && base::IsSameFile(*locked, *named);
}

/// What a lock file holds: somebody may have another file of that name.
constexpr std::string_view kMark = "A lock of corvane-flash\n";

bool HoldsMark(const base::Descriptor& file) {
    std::array<char, kMark.size() + 1> text{};
    const auto count = base::ReadBeginning(file.Get(), text);
    return count && std::string_view(text.data(), *count) == kMark;
}

/// Makes the lock file, or opens the one that is there.
base::Descriptor OpenLock(const std::string& path, bool& made) {
    base::Descriptor file = base::OpenNew(path);
    made = file.IsOpen();
    if (made) WriteAll(file.Get(), kMark);
    return made || errno != EEXIST ? std::move(file) : base::OpenBehindNoLink(path);
}

base::LockState Lock(base::Descriptor& file, const std::string& path, bool& made) {
    const std::string directory = base::NameOf(base::PathOf(path).parent_path());
    for (;;) {
        file = OpenLock(path, made);
        const bool gone = !file.IsOpen() && errno == ENOENT;
        if (gone && base::StatusOf(directory)) continue;
        if (!file.IsOpen()) return base::LockState::Impossible;
        const base::LockState state = base::TryLock(file.Get());
        if (state != base::LockState::Locked) {
            file = base::Descriptor();
            return state;
        }
        if (IsStillThere(file, path)) return state;
    }
}

}  // namespace

std::string LockPath(const std::string& path) {
    const std::string file = base::CanonicalPath(path);
    return file.empty() ? "" : file + ".lock";
}

FileLock::FileLock(const FileKind& kind, const std::string& path, const WaitNotice& say)
    : path_(LockPath(path)) {
    if (path_.empty()) return;
    const auto start = Clock::now();
    for (bool said = false; Lock(file_, path_, made_) == base::LockState::Busy; said = true) {
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
    if (made_ || HoldsMark(file_)) base::Remove(path_);
}

}  // namespace host
