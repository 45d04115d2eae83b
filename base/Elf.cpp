// The header, and the table of segments behind it. The tables of sections are for linkers and
// debuggers; they are only looked for, because a file that lacks them was cut off.

#include "base/Elf.h"

#include <fmt/format.h>

#include <cstddef>
#include <string>

#include "base/ByteOrder.h"

namespace base {

namespace {

constexpr std::string_view kMagic = "\177ELF";
constexpr std::size_t kHeaderBytes = 52;
constexpr std::size_t kSegmentEntryBytes = 32;
constexpr std::size_t kSectionEntryBytes = 40;
constexpr char kClass32 = 1;
constexpr char kLittleEndian = 1;
constexpr unsigned kExecutable = 2;
constexpr unsigned kMachineArm = 40;
constexpr std::uint32_t kLoad = 1;

[[noreturn]] void FailDamaged(const std::string& text) {
    throw ElfError(text + "; the file is damaged: fetch or make it anew");
}

class Reader {
  public:
    explicit Reader(std::string_view contents) : contents_(contents) {
        if (!LooksLikeElf(contents))
            throw ElfError("no ELF header found; give an ELF file or the format that this one has");
        RequireInFile("ELF header", 0, kHeaderBytes);
        RequireProgramOfDevice();
    }

    ElfProgram Read() const {
        const unsigned count = Half(44);
        RequireTable("program header table", Word(28), Half(42), count, kSegmentEntryBytes);
        RequireTable("section header table", Word(32), Half(46), Half(48), kSectionEntryBytes);
        ElfProgram program{Word(24), {}};
        for (unsigned i = 0; i < count; ++i)
            AddSegment(program, i, Word(28) + i * kSegmentEntryBytes);
        return program;
    }

  private:
    unsigned Half(std::size_t offset) const { return Word(offset) & 0xFFFF; }
    std::uint32_t Word(std::size_t offset) const { return WordOf(contents_.substr(offset)); }

    void RequireProgramOfDevice() const {
        const bool wide = contents_[4] != kClass32;
        const bool bigEndian = contents_[5] != kLittleEndian;
        const unsigned type = bigEndian ? (Half(16) >> 8 | (Half(16) & 0xFF) << 8) : Half(16);
        const unsigned machine = Half(18);
        static constexpr const char* kKinds[] = {
            nullptr, "a relocatable object", "an executable",
            "a shared object or a position-independent program", "a core"};
        const bool arm = wide || bigEndian || machine == kMachineArm;
        if (!wide && !bigEndian && type == kExecutable && arm) return;
        const bool known = type != 0 && type < std::size(kKinds);
        throw ElfError(
            fmt::format("{}{}{}{} found, a 32-bit little-endian executable expected; give the "
                        "program that is linked for the device",
                        known ? kKinds[type] : fmt::format("a file of type {}", type),
                        wide ? ", 64-bit" : "", bigEndian ? ", big-endian" : "",
                        arm ? "" : fmt::format(", for another machine than Arm ({})", machine)));
    }

    void RequireTable(const char* what, std::uint32_t offset, unsigned entryBytes, unsigned count,
                      std::size_t expected) const {
        if (count == 0) return;
        if (entryBytes != expected)
            FailDamaged(fmt::format("{}: entries of {} bytes found, {} expected", what, entryBytes,
                                    expected));
        RequireInFile(what, offset, std::uint64_t{count} * expected);
    }

    void RequireInFile(const std::string& what, std::uint64_t offset, std::uint64_t size) const {
        if (offset <= contents_.size() && size <= contents_.size() - offset) return;
        throw ElfError(
            fmt::format("{}: {} bytes expected at offset {}, but the file ends at {}; it is "
                        "probably cut off: fetch or make it anew",
                        what, size, offset, contents_.size()));
    }

    void AddSegment(ElfProgram& program, unsigned number, std::size_t entry) const {
        const std::uint32_t offset = Word(entry + 4);
        const std::uint32_t fileBytes = Word(entry + 16);
        const std::uint32_t memoryBytes = Word(entry + 20);
        if (Word(entry) != kLoad || (fileBytes == 0 && memoryBytes == 0)) return;
        const std::string what = fmt::format("segment {}", number);
        RequireInFile(what, offset, fileBytes);
        if (fileBytes > memoryBytes)
            FailDamaged(fmt::format("{}: {} bytes in the file, but {} in memory", what, fileBytes,
                                    memoryBytes));
        program.segments.push_back(
            {number, Word(entry + 12), contents_.substr(offset, fileBytes), memoryBytes});
    }

    const std::string_view contents_;
};

}  // namespace

bool LooksLikeElf(std::string_view contents) {
    return contents.starts_with(kMagic);
}

ElfProgram ReadElf(std::string_view contents) {
    return Reader(contents).Read();
}

}  // namespace base
