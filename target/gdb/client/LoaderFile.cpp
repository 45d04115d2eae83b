// Reading the file, and filling up what a segment's memory has beyond its bytes in the file.

#include "target/gdb/client/LoaderFile.h"

#include <fmt/format.h>

#include <cerrno>
#include <span>

#include "base/Elf.h"
#include "base/system/ErrorText.h"
#include "base/system/Files.h"
#include "target/Target.h"

namespace target::gdb {

namespace {

/// Far more than the RAM of any device, debugging information included.
constexpr std::uint64_t kFileBytesMax = std::uint64_t{64} << 20;
constexpr std::uint64_t kMemoryBytesMax = std::uint64_t{16} << 20;

[[noreturn]] void RefuseForError(const std::string& path, const char* what) {
    RefuseLoader(path, fmt::format("can't be {}: {}", what, base::ErrorText(errno)));
}

std::string ReadContents(const std::string& path) {
    // Doesn't wait for the writer of a pipe, which is no loader anyway.
    const base::Descriptor file = base::OpenToRead(path);
    if (!file.IsOpen()) RefuseForError(path, "opened");
    const auto status = base::StatusOf(file.Get());
    if (!status || status->type != base::FileType::Regular)
        RefuseLoader(path, "is no regular file");
    if (status->sizeBytes > kFileBytesMax)
        RefuseLoader(path, "is too large for a program in a microcontroller's RAM");
    std::string contents(status->sizeBytes, '\0');
    for (std::size_t done = 0; done < contents.size();) {
        const auto got = base::ReadFrom(file.Get(), std::span(contents).subspan(done));
        if (!got && errno != EAGAIN) RefuseForError(path, "read");
        if (got == 0U) contents.resize(done);  // it became shorter just now
        done += got.value_or(0);
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
