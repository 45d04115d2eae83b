// dlopen and dlsym, and where the library is looked for.

#include "host/driver/PluginLibrary.h"

#include <dlfcn.h>
#include <fmt/format.h>
#include <link.h>

#include <cstring>
#include <filesystem>
#include <fstream>
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

/// Whether a library's file ends before what its headers promise. The system would map it all the
/// same, and the process would die at the first byte that isn't there.
bool IsCutShort(const std::string& file, std::uintmax_t fileBytes) {
    std::ifstream stream(file, std::ios::binary);
    ElfW(Ehdr) header{};
    stream.read(reinterpret_cast<char*>(&header), sizeof header);
    // What is no library of this machine at all, dlopen tells best.
    if (!stream || std::memcmp(header.e_ident, ELFMAG, SELFMAG) != 0 ||
        header.e_phentsize != sizeof(ElfW(Phdr)))
        return false;
    stream.seekg(static_cast<std::streamoff>(header.e_phoff));
    for (unsigned i = 0; i < header.e_phnum; ++i) {
        ElfW(Phdr) segment{};
        stream.read(reinterpret_cast<char*>(&segment), sizeof segment);
        if (!stream) return true;
        if (segment.p_type == PT_LOAD &&
            (segment.p_offset > fileBytes || segment.p_filesz > fileBytes - segment.p_offset))
            return true;
    }
    return false;
}

/// Refuses what dlopen would hang or die on. A bare name is the system's to find.
void RequireWhole(const std::string& file) {
    std::error_code error;
    const fs::file_status status = fs::status(file, error);
    if (file.find('/') == std::string::npos || !fs::exists(status)) return;
    const bool regular = fs::is_regular_file(status);
    const std::uintmax_t bytes = regular ? fs::file_size(file, error) : 0;
    if (regular && (error || !IsCutShort(file, bytes))) return;
    throw Failure(ExitStatus::Unreachable,
                  fmt::format("can't load the plug-in: {} is {}; name another one with --plugin or "
                              "CORVANE_PLUGIN",
                              file, regular ? "cut short" : "no regular file"));
}

}  // namespace

std::string PluginFile(const std::string& path) {
    if (path.empty()) return InstalledPath();
    // A bare file name would be looked for where the system keeps its libraries, not here.
    return path.find('/') == std::string::npos ? "./" + path : path;
}

PluginLibrary::PluginLibrary(const std::string& path) {
    const std::string file = PluginFile(path);
    RequireWhole(file);
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
