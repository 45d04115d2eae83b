// Finding, loading and unloading the plug-in, and the one function that it exports.

#pragma once

#include <memory>
#include <string>

#include "plugin/IFlashDevice2.h"

namespace host {

/// The plug-in library's file: the one at `path`; for an empty one, the libflash_corvane.so that
/// was installed with the tool, or else its mere name, which the system's loader looks for.
std::string PluginFile(const std::string& path);

class PluginLibrary {
  public:
    /// Loads the library that PluginFile tells. Failure (Unreachable) says what the
    /// loader said, or that the library is no plug-in.
    explicit PluginLibrary(const std::string& path);

    CreateFlashDevice2Function CreateDevice() const { return create_; }
    void* Handle() const { return handle_.get(); }

    /// The file that was loaded.
    std::string Path() const;

  private:
    struct Unloader {
        void operator()(void* handle) const;
    };
    std::unique_ptr<void, Unloader> handle_;
    CreateFlashDevice2Function create_ = nullptr;
};

/// The directory that the running executable lies in, with a slash at its end.
std::string ExecutableDirectory();

}  // namespace host
