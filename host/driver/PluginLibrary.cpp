// Where the library is looked for, and what is said of one that isn't the plug-in.

#include "host/driver/PluginLibrary.h"

#include <fmt/format.h>

#include <filesystem>
#include <system_error>

#include "base/system/Environment.h"
#include "base/system/Paths.h"
#include "host/base/Errors.h"

namespace host {

namespace {

namespace fs = std::filesystem;

constexpr char kLibrary[] = "flash_corvane";

/// CORVANE_LIBRARY_DIRECTORY is where the library is installed, relative to the tool: on a system
/// with several architectures that isn't just "../lib".
std::string InstalledPath() {
    std::string file = base::LibraryFileName(kLibrary);
    std::error_code ignored;
    for (const char* directory : {"../lib", CORVANE_LIBRARY_DIRECTORY})
        if (fs::path path = base::PathOf(base::ExecutableDirectory()) / directory / file;
            fs::exists(path, ignored))
            return base::NameOf(path.lexically_normal());
    return file;
}

base::SharedLibrary Load(const std::string& file) try {
    return base::SharedLibrary(file);
} catch (const base::LibraryError& error) {
    throw Failure(ExitStatus::Unreachable,
                  fmt::format("can't load the plug-in: {}; name another one with --plugin or "
                              "CORVANE_PLUGIN",
                              error.what()));
}

}  // namespace

std::string PluginFile(const std::string& path) {
    if (path.empty()) return InstalledPath();
    // A bare file name would be looked for where the system keeps its libraries, not here.
    return base::PathOf(path).has_parent_path() ? path : "./" + path;
}

PluginLibrary::PluginLibrary(const std::string& path)
    : library_(Load(PluginFile(path))),
      create_(reinterpret_cast<CreateFlashDevice2Function>(library_.Find("CreateFlashDevice2"))) {
    if (create_ == nullptr)
        throw Failure(ExitStatus::Unreachable,
                      fmt::format("{} is no flash plug-in: it exports no CreateFlashDevice2; name "
                                  "another library with --plugin",
                                  PluginFile(path)));
}

std::string PluginLibrary::Path() const {
    const std::string file = base::SharedLibrary::FileOf(reinterpret_cast<const void*>(create_));
    return file.empty() ? base::LibraryFileName(kLibrary) : file;
}

}  // namespace host
