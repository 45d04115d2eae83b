// Finding, loading and unloading the plug-in, and the one function that it exports.

#pragma once

#include <string>

#include "base/system/SharedLibrary.h"
#include "plugin/IFlashDevice2.h"

namespace host {

/// The plug-in library's file: the one at `path`; for an empty one, the flash_corvane library that
/// was installed with the tool, or else its mere name, which the system's loader looks for.
std::string PluginFile(const std::string& path);

class PluginLibrary {
  public:
    /// Loads the library that PluginFile tells. Failure (Unreachable) says what the
    /// loader said, or that the library is no plug-in.
    explicit PluginLibrary(const std::string& path);

    CreateFlashDevice2Function CreateDevice() const { return create_; }
    const base::SharedLibrary& Library() const { return library_; }

    /// The file that was loaded.
    std::string Path() const;

  private:
    base::SharedLibrary library_;
    CreateFlashDevice2Function create_;
};

}  // namespace host
