// ELF: every loadable segment with bytes in the file, at its physical address. libelf knows the
// classes and byte orders; whether the file has all that it announces is checked here, because
// libelf leaves out in silence what lies behind the end of the file.

#include <fmt/format.h>
#include <gelf.h>
#include <libelf.h>

#include <algorithm>
#include <memory>

#include "host/base/Errors.h"
#include "host/image/Formats.h"

namespace host::image {
namespace {

class ElfReader {
  public:
    ElfReader(const std::string& contents, const std::string& name)
        : contents_(contents), name_(name), elf_(Open(contents), elf_end) {
        if (elf_ == nullptr) FailInLibrary("ELF header");
        if (elf_kind(elf_.get()) != ELF_K_ELF) {
            Fail("no ELF header found; give an ELF file or the format that this one has");
        }
        if (gelf_getehdr(elf_.get(), &header_) == nullptr) FailInLibrary("ELF header");
        RequireProgramOfDevice();
    }

    Image Read() const {
        const std::size_t count = SegmentCount();
        RequireTable("program header table", header_.e_phoff, count, header_.e_phentsize,
                     ELF_T_PHDR);
        RequireTable("section header table", header_.e_shoff, header_.e_shnum, header_.e_shentsize,
                     ELF_T_SHDR);
        Image image;
        for (std::size_t index = 0; index < count; ++index)
            AddSegment(image, index);
        return image;
    }

  private:
    /// libelf asks for writable memory, and writes only when it is told to.
    static Elf* Open(const std::string& contents) {
        elf_version(EV_CURRENT);
        return elf_memory(const_cast<char*>(contents.data()), contents.size());
    }

    /// The devices are 32-bit and little-endian, and run what is linked to fixed addresses.
    void RequireProgramOfDevice() const {
        const char* const kinds[] = {nullptr, "a relocatable object", "an executable",
                                     "a shared object or a position-independent program", "a core"};
        const bool known = header_.e_type > ET_NONE && header_.e_type <= ET_CORE;
        const std::string kind =
            known ? kinds[header_.e_type] : fmt::format("a file of type {}", header_.e_type);
        const bool wide = header_.e_ident[EI_CLASS] != ELFCLASS32;
        const bool bigEndian = header_.e_ident[EI_DATA] != ELFDATA2LSB;
        if (!wide && !bigEndian && header_.e_type == ET_EXEC) return;
        Fail(
            fmt::format("{}{}{} found, a 32-bit little-endian executable expected; give the "
                        "program that is linked for the device",
                        kind, wide ? ", 64-bit" : "", bigEndian ? ", big-endian" : ""));
    }

    std::size_t SegmentCount() const {
        std::size_t count = 0;
        if (elf_getphdrnum(elf_.get(), &count) != 0) FailInLibrary("program header table");
        return std::max<std::size_t>(count, header_.e_phnum);
    }

    /// A table that is cut off condemns the file even where no byte to load is missing.
    void RequireTable(const char* what, std::uint64_t offset, std::size_t count,
                      std::size_t entrySize, Elf_Type type) const {
        if (count == 0) return;
        const std::size_t expected = gelf_fsize(elf_.get(), type, 1, EV_CURRENT);
        if (entrySize != expected) {
            Fail(
                fmt::format("{}: entries of {} bytes found, {} expected; the file is damaged: "
                            "fetch or make it anew",
                            what, entrySize, expected));
        }
        RequireInFile(what, offset, std::uint64_t{count} * entrySize);
    }

    void RequireInFile(const std::string& what, std::uint64_t offset, std::uint64_t size) const {
        if (offset <= contents_.size() && size <= contents_.size() - offset) return;
        Fail(
            fmt::format("{}: {} bytes expected at offset {}, but the file ends at {}; it is "
                        "probably cut off: fetch or make it anew",
                        what, size, offset, contents_.size()));
    }

    void AddSegment(Image& image, std::size_t index) const {
        const std::string what = fmt::format("segment {}", index);
        GElf_Phdr segment{};
        if (gelf_getphdr(elf_.get(), static_cast<int>(index), &segment) == nullptr) {
            FailInLibrary(what);
        }
        if (segment.p_type != PT_LOAD || segment.p_filesz == 0) return;
        RequireInFile(what, segment.p_offset, segment.p_filesz);
        const auto begin = contents_.begin() + static_cast<std::ptrdiff_t>(segment.p_offset);
        image.Add(static_cast<std::uint32_t>(segment.p_paddr),
                  {begin, begin + static_cast<std::ptrdiff_t>(segment.p_filesz)},
                  fmt::format("{}: {}", name_, what));
    }

    [[noreturn]] void FailInLibrary(const std::string& what) const {
        const char* reason = elf_errmsg(elf_errno());
        Fail(fmt::format(
            "{} can't be read ({}); the file is damaged or cut off: fetch or make it anew", what,
            reason != nullptr ? reason : "no reason given"));
    }

    [[noreturn]] void Fail(const std::string& text) const {
        throw Failure(ExitStatus::BadFile, fmt::format("{}: {}", name_, text));
    }

    const std::string& contents_;
    const std::string& name_;
    std::unique_ptr<Elf, int (*)(Elf*)> elf_;
    GElf_Ehdr header_{};
};

}  // namespace

Image ParseElf(const std::string& contents, const std::string& name) {
    return ElfReader(contents, name).Read();
}

}  // namespace host::image
