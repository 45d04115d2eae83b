// Reading the file, and filling up what a segment's memory has beyond its bytes in the file.

#include "target/gdb/client/LoaderFile.h"

#include <fcntl.h>
#include <fmt/format.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>

#include "base/Descriptor.h"
#include "base/Elf.h"
#include "target/Target.h"

namespace target::gdb {

namespace {

/// Far more than the RAM of any device, debugging information included.
constexpr std::uint64_t kFileBytesMax = std::uint64_t{64} << 20;
constexpr std::uint64_t kMemoryBytesMax = std::uint64_t{16} << 20;

[[noreturn]] void RefuseForError(const std::string& path, const char* what) {
    RefuseLoader(path,
                 fmt::format("can't be {}: {}", what, std::generic_category().message(errno)));
}

/// Doesn't wait for the writer of a pipe, which is no loader anyway.
base::Descriptor OpenFile(const std::string& path) {
    base::Descriptor file(open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
    if (!file.IsOpen()) RefuseForError(path, "opened");
    return file;
}

std::string ReadContents(const std::string& path) {
    const base::Descriptor file = OpenFile(path);
    struct stat status {};
    if (fstat(file.Get(), &status) != 0 || !S_ISREG(status.st_mode))
        RefuseLoader(path, "is no regular file");
    const auto size = static_cast<std::uint64_t>(status.st_size);
    if (size > kFileBytesMax)
        RefuseLoader(path, "is too large for a program in a microcontroller's RAM");
    std::string contents(size, '\0');
    for (std::size_t done = 0; done < contents.size();) {
        const ssize_t got = read(file.Get(), contents.data() + done, contents.size() - done);
        if (got < 0 && errno != EINTR) RefuseForError(path, "read");
        if (got == 0) contents.resize(done);  // it became shorter just now
        if (got > 0) done += static_cast<std::size_t>(got);
    }
    return contents;
}

}  // namespace

void RefuseLoader(const std::string& path, const std::string& why) {
    throw TargetError(fmt::format("the loader {} {}; --loader FILE names another one", path, why));
}

LoaderFile ReadLoaderFile(const std::string& path) try {
    const std::string contents = ReadContents(path);
    const base::ElfProgram program = base::ReadElf(contents);
    LoaderFile loader{{}, program.entry};
    std::uint64_t memoryBytes = 0;
    for (const base::ElfSegment& segment : program.segments) {
        memoryBytes += segment.memoryBytes;
        if (memoryBytes > kMemoryBytesMax)
            RefuseLoader(path, "is too large for a program in a microcontroller's RAM");
        loader.segments.push_back({segment.address, std::string(segment.bytes)});
        loader.segments.back().bytes.resize(segment.memoryBytes, '\0');
    }
    if (loader.segments.empty()) RefuseLoader(path, "holds nothing to load");
    return loader;
} catch (const base::ElfError& error) {
    RefuseLoader(path, fmt::format("can't be loaded: {}", error.what()));
}

}  // namespace target::gdb
