// A lock that keeps other runs of the tool away from a file. It outlives the replacing of the file,
// for it lies on one of its own beside it, which is removed when nobody needs it any more.

#pragma once

#include <functional>
#include <string>

#include "base/system/Descriptor.h"
#include "host/files/FileKind.h"

namespace host {

/// Tells the user, in one sentence, which run is waited for and for how long.
using WaitNotice = std::function<void(const std::string&)>;

/// The file is locked by another run, and stayed so for as long as we wait.
class FileBusy : public Failure {
  public:
    using Failure::Failure;
};

/// Where the lock of a file lies; empty for a name that leads nowhere.
std::string LockPath(const std::string& path);

class FileLock {
  public:
    /// Takes the lock of a file that need not exist, whatever the name that leads to it, and
    /// removes what killed runs have left of the file. Another run is waited for up to 10 s, which
    /// `say` tells the user; then FileBusy (of the kind's status). Where no lock file can be made,
    /// no run can replace the file either: nothing is locked.
    FileLock(const FileKind& kind, const std::string& path, const WaitNotice& say);
    ~FileLock();

    FileLock(const FileLock&) = delete;
    FileLock& operator=(const FileLock&) = delete;

  private:
    std::string path_;
    base::Descriptor file_;
    bool made_ = false;  ///< the lock file is this run's
};

}  // namespace host
