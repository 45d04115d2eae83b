// dlopen and dlsym, and where the library is looked for.

#include "host/driver/PluginLibrary.h"

#include <dlfcn.h>
#include <fmt/format.h>

#include <filesystem>
#include <system_error>

#include "host/base/Errors.h"

namespace host {

namespace {

namespace fs = std::filesystem;

constexpr char kFileName[] = "libflash_corvane.so";

/// CORVANE_LIBRARY_DIRECTORY is where the library is installed, relative to the tool: on a system
/// with several architectures that isn't just "../lib".
std::string InstalledPath() {
    std::error_code ignored;
    for (const char* directory : {"../lib", CORVANE_LIBRARY_DIRECTORY})
        if (fs::path path = fs::path(ExecutableDirectory()) / directory / kFileName;
            fs::exists(path, ignored))
            return path.lexically_normal();
    return kFileName;
}

}  // namespace

std::string PluginFile(const std::string& path) {
    if (path.empty()) return InstalledPath();
    // A bare file name would be looked for where the system keeps its libraries, not here.
    return path.find('/') == std::string::npos ? "./" + path : path;
}

PluginLibrary::PluginLibrary(const std::string& path) {
    const std::string file = PluginFile(path);
    handle_.reset(dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL));
    if (!handle_)
        throw Failure(ExitStatus::Unreachable,
                      fmt::format("can't load the plug-in: {}; name another one with --plugin or "
                                  "CORVANE_PLUGIN",
                                  dlerror()));
    create_ =
        reinterpret_cast<CreateFlashDevice2Function>(dlsym(handle_.get(), "CreateFlashDevice2"));
    if (create_ == nullptr)
        throw Failure(ExitStatus::Unreachable,
                      fmt::format("{} is no flash plug-in: it exports no CreateFlashDevice2; name "
                                  "another library with --plugin",
                                  file));
}

std::string PluginLibrary::Path() const {
    Dl_info info{};
    const auto* address = reinterpret_cast<const void*>(create_);
    return dladdr(address, &info) != 0 && info.dli_fname != nullptr ? info.dli_fname : kFileName;
}

void PluginLibrary::Unloader::operator()(void* handle) const {
    dlclose(handle);
}

std::string ExecutableDirectory() {
    std::error_code error;
    const fs::path self = fs::read_symlink("/proc/self/exe", error);
    return error ? "./" : self.parent_path().string() + "/";
}

}  // namespace host
