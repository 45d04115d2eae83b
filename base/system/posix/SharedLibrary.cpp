// dlopen and dlsym.

#include "base/system/SharedLibrary.h"

#include <dlfcn.h>
#include <link.h>

#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <system_error>

namespace base {

namespace {

namespace fs = std::filesystem;

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

void RequireWhole(const std::string& file) {
    std::error_code error;
    const fs::file_status status = fs::status(file, error);
    if (file.find('/') == std::string::npos || !fs::exists(status)) return;
    if (!fs::is_regular_file(status)) throw LibraryError(file + " is no regular file");
    const std::uintmax_t bytes = fs::file_size(file, error);
    if (error || IsCutShort(file, bytes)) throw LibraryError(file + " is cut short");
}

}  // namespace

std::string LibraryFileName(const std::string& name) {
    return "lib" + name + ".so";
}

SharedLibrary::SharedLibrary(const std::string& file) {
    RequireWhole(file);
    handle_.reset(dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL));
    if (!handle_) throw LibraryError(dlerror());
}

void* SharedLibrary::Find(const char* function) const {
    return dlsym(handle_.get(), function);
}

std::string SharedLibrary::FileOf(const void* function) {
    Dl_info info{};
    return dladdr(function, &info) != 0 && info.dli_fname != nullptr ? info.dli_fname : "";
}

void SharedLibrary::Unloader::operator()(void* handle) const {
    dlclose(handle);
}

}  // namespace base
