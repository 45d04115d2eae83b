// Files are the same by device and inode; where there is none yet, by the name behind all links.

#include "host/files/FilesInUse.h"

#include <fmt/format.h>

#include <filesystem>

#include "base/system/Files.h"
#include "host/base/Errors.h"
#include "host/files/FileLock.h"
#include "host/files/OutputFile.h"

namespace host {

namespace {

/// A terminal or /dev/null can be read and written at once: nothing gets lost.
bool IsSameFile(const std::string& one, const std::string& other) {
    const auto first = base::StatusOf(one);
    const auto second = base::StatusOf(other);
    if (first && second)
        return base::IsSameFile(*first, *second) && first->type != base::FileType::CharacterDevice;
    std::error_code ignored;
    const auto name = [&](const std::string& path) {
        return std::filesystem::weakly_canonical(std::filesystem::absolute(FollowLinks(path)),
                                                 ignored);
    };
    return !first && !second && name(one) == name(other);
}

}  // namespace

void FilesInUse::Add(const std::string& path, const std::string& what) {
    if (!path.empty()) files_.push_back({path, what});
}

void FilesInUse::AddLocked(const std::string& path, const std::string& what) {
    Add(path, what);
    if (!path.empty()) Add(LockPath(path), "the lock of " + what);
}

void FilesInUse::RequireOther(const std::string& path, const std::string& output) const {
    if (path.empty() || path == "-") return;
    for (const File& file : files_)
        if (IsSameFile(path, file.path))
            throw Failure(ExitStatus::WrongUsage,
                          fmt::format("{} can't be written to {}: that is {} of this run, {}; name "
                                      "another file",
                                      output, path, file.what, file.path));
}

}  // namespace host
