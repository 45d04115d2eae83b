// Writing a file whole or not at all.

#include "host/base/Files.h"

#include <fmt/format.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <filesystem>
#include <system_error>

#include "host/base/Errors.h"

namespace host {

namespace {

namespace fs = std::filesystem;

[[noreturn]] void FailWith(int error, const std::string& path, const char* what) {
    throw Failure(ExitStatus::BadFile,
                  fmt::format("can't write {} to {}: {}", what, path,
                              std::error_code(error, std::generic_category()).message()));
}

/// Writes everything and closes the stream; 0, or the error number.
int WriteAndClose(std::FILE* stream, const std::string& contents) {
    if (stream == nullptr) return errno;
    int error = 0;
    if (std::fwrite(contents.data(), 1, contents.size(), stream) != contents.size() ||
        std::fflush(stream) != 0)
        error = errno;
    if (std::fclose(stream) != 0 && error == 0) error = errno;
    return error;
}

/// The permissions of a file that is created without any wish of its own.
mode_t DefaultMode() {
    const mode_t mask = umask(0);
    umask(mask);
    return static_cast<mode_t>(0666 & ~mask);
}

}  // namespace

void WriteWholeFile(const std::string& path, const std::string& contents, const char* what) {
    std::error_code ignored;
    const fs::file_status status = fs::status(path, ignored);
    if (fs::exists(status) && !fs::is_regular_file(status)) {
        if (const int error = WriteAndClose(std::fopen(path.c_str(), "wb"), contents))
            FailWith(error, path, what);
        return;
    }
    // A symbolic link stays one: the file that it points to is replaced.
    const fs::path target = fs::exists(status) ? fs::canonical(path, ignored) : fs::path(path);
    std::string temporary = target.string() + ".XXXXXX";
    const int descriptor = mkstemp(temporary.data());
    if (descriptor < 0) FailWith(errno, path, what);
    fchmod(descriptor,
           fs::exists(status) ? static_cast<mode_t>(status.permissions()) & 0777 : DefaultMode());
    int error = WriteAndClose(fdopen(descriptor, "wb"), contents);
    if (error == 0 && std::rename(temporary.c_str(), target.c_str()) != 0) error = errno;
    if (error == 0) return;
    unlink(temporary.c_str());
    FailWith(error, path, what);
}

}  // namespace host
