// The loadable segments of an ELF file, and its entry point.

#include "target/gdb/client/LoaderFile.h"

#include <fcntl.h>
#include <fmt/format.h>
#include <libelf.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <memory>
#include <system_error>

#include "target/Target.h"

namespace target::gdb {

namespace {

constexpr std::uint64_t kLoadedSizeMax = std::uint64_t{16} * 1024 * 1024;

[[noreturn]] void Refuse(const std::string& path, const std::string& why) {
    throw TargetError(fmt::format("the loader {} {}; --loader FILE names another one", path, why));
}

class File {
  public:
    /// Doesn't wait for the writer of a pipe, which is no loader anyway.
    explicit File(const std::string& path)
        : descriptor_(open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC)) {
        if (descriptor_ < 0)
            Refuse(path, "can't be opened: " + std::generic_category().message(errno));
    }
    ~File() { close(descriptor_); }
    File(const File&) = delete;
    File& operator=(const File&) = delete;

    int Descriptor() const { return descriptor_; }

  private:
    int descriptor_;
};

LoaderFile::Segment ReadSegment(const File& file, const Elf32_Phdr& header,
                                const std::string& path) {
    LoaderFile::Segment segment{header.p_paddr, std::string(header.p_memsz, '\0')};
    for (std::size_t done = 0; done < header.p_filesz;) {
        const auto offset = static_cast<off_t>(header.p_offset + done);
        const ssize_t got =
            pread(file.Descriptor(), segment.bytes.data() + done, header.p_filesz - done, offset);
        if (got == 0) Refuse(path, "ends too early: it is cut off");
        if (got < 0 && errno != EINTR)
            Refuse(path, "can't be read: " + std::generic_category().message(errno));
        if (got > 0) done += static_cast<std::size_t>(got);
    }
    return segment;
}

void RequireRegularFile(const File& file, const std::string& path) {
    struct stat status {};
    if (fstat(file.Descriptor(), &status) != 0 || !S_ISREG(status.st_mode))
        Refuse(path, "is no regular file");
}

}  // namespace

LoaderFile ReadLoaderFile(const std::string& path) {
    const File file(path);
    RequireRegularFile(file, path);
    elf_version(EV_CURRENT);
    const std::unique_ptr<Elf, int (*)(Elf*)> elf(elf_begin(file.Descriptor(), ELF_C_READ, nullptr),
                                                  elf_end);
    const Elf32_Ehdr* header = elf ? elf32_getehdr(elf.get()) : nullptr;
    if (header == nullptr || header->e_ident[EI_DATA] != ELFDATA2LSB || header->e_type != ET_EXEC)
        Refuse(path, "is no 32-bit, little-endian ELF executable");
    std::size_t count = 0;
    const Elf32_Phdr* headers = elf32_getphdr(elf.get());
    if (headers == nullptr || elf_getphdrnum(elf.get(), &count) != 0) count = 0;

    LoaderFile loader{{}, header->e_entry};
    std::uint64_t size = 0;
    for (std::size_t i = 0; i < count; ++i) {
        if (headers[i].p_type != PT_LOAD || headers[i].p_memsz == 0) continue;
        size += headers[i].p_memsz;
        if (size > kLoadedSizeMax || headers[i].p_filesz > headers[i].p_memsz)
            Refuse(path, "is damaged, or no program for a microcontroller's RAM");
        loader.segments.push_back(ReadSegment(file, headers[i], path));
    }
    if (loader.segments.empty()) Refuse(path, "holds nothing to load");
    return loader;
}

}  // namespace target::gdb
