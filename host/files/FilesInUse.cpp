// Files are the same by device and inode; where there is none yet, by the name behind all links.

#include "host/files/FilesInUse.h"

#include <fmt/format.h>

#include <optional>

#include "base/system/Files.h"
#include "base/system/StandardStreams.h"
#include "host/base/Errors.h"
#include "host/files/FileLock.h"

namespace host {

namespace {

/// A terminal or /dev/null can be read and written at once: nothing gets lost.
bool IsSameFile(const std::optional<base::FileStatus>& one,
                const std::optional<base::FileStatus>& other) {
    return one && other && base::IsSameFile(*one, *other) &&
           one->type != base::FileType::CharacterDevice;
}

/// Files that aren't there, but may be made.
bool IsSameName(const std::string& one, const std::string& other) {
    const std::string name = base::CanonicalPath(one);
    return !name.empty() && name == base::CanonicalPath(other);
}

}  // namespace

void FilesInUse::Add(const std::string& path, const std::string& what) {
    if (!path.empty()) files_.push_back({path, what});
}

void FilesInUse::AddStandardInput() {
    files_.push_back({base::kStandardInputName, "the standard input", true});
}

void FilesInUse::AddLocked(const std::string& path, const std::string& what) {
    Add(path, what);
    if (!path.empty()) Add(LockPath(path), "the lock of " + what);
}

void FilesInUse::RequireOther(const std::string& path, const std::string& output) const {
    if (path.empty() || path == "-") return;
    const auto status = base::StatusOf(path);
    for (const File& file : files_) {
        const auto used =
            file.isStandardInput ? base::StatusOf(base::kStandardInput) : base::StatusOf(file.path);
        if (IsSameFile(status, used) || (!status && !used && IsSameName(path, file.path)))
            throw Failure(ExitStatus::WrongUsage,
                          fmt::format("{} can't be written to {}: that is {} of this run, {}; name "
                                      "another file",
                                      output, path, file.what, file.path));
    }
}

}  // namespace host
