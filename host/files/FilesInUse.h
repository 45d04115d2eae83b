// The files that a run works with, so that nothing that it writes goes over one of them.

#pragma once

#include <string>
#include <vector>

namespace host {

class FilesInUse {
  public:
    /// `what` says what the file is to the run: "the image file". An empty path adds none.
    void Add(const std::string& path, const std::string& what);

    /// The same for a file that is locked: its lock is in use as well.
    void AddLocked(const std::string& path, const std::string& what);

    /// The file that standard input comes from.
    void AddStandardInput();

    /// Failure (WrongUsage) when `path`, where `output` is to be written, is one of them under any
    /// name, links included.
    void RequireOther(const std::string& path, const std::string& output) const;

  private:
    struct File {
        std::string path;
        std::string what;
        bool isStandardInput = false;
    };
    std::vector<File> files_;
};

}  // namespace host
