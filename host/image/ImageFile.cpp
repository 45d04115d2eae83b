// Reading an image file: getting its contents, telling its format, and calling the right reader.

#include <fcntl.h>
#include <fmt/format.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <string_view>
#include <system_error>

#include "host/base/Errors.h"
#include "host/base/HexDigits.h"
#include "host/image/Formats.h"

namespace host::image {
namespace {

class File {
  public:
    explicit File(const std::string& path)
        : path_(path), descriptor_(open(path.c_str(), O_RDONLY | O_CLOEXEC)) {
        if (descriptor_ < 0) Fail();
    }
    ~File() { close(descriptor_); }
    File(const File&) = delete;
    File& operator=(const File&) = delete;

    std::string Contents() const {
        std::string contents;
        contents.resize(kChunkBytes + SizeHint());
        std::size_t size = 0;
        while (const std::size_t count = Read(contents.data() + size, contents.size() - size)) {
            size += count;
            if (size == contents.size()) contents.resize(2 * size);
        }
        contents.resize(size);
        return contents;
    }

  private:
    static constexpr std::size_t kChunkBytes = 65536;

    /// The size of a regular file; a pipe doesn't know its own.
    std::size_t SizeHint() const {
        struct stat status {};
        const bool known = fstat(descriptor_, &status) == 0 && S_ISREG(status.st_mode);
        return known ? static_cast<std::size_t>(status.st_size) : 0;
    }

    std::size_t Read(char* buffer, std::size_t size) const {
        ssize_t count = -1;
        do {
            count = read(descriptor_, buffer, size);
        } while (count < 0 && errno == EINTR);
        if (count < 0) Fail();
        return static_cast<std::size_t>(count);
    }

    [[noreturn]] void Fail() const {
        throw Failure(
            ExitStatus::BadFile,
            fmt::format("{}: the image file can't be read: {}; check its name and permissions",
                        path_, std::generic_category().message(errno)));
    }

    const std::string& path_;
    const int descriptor_;
};

std::optional<Format> DetectFormat(std::string_view contents) {
    if (contents.starts_with("\177ELF")) return Format::Elf;
    contents.remove_prefix(std::min(contents.find_first_not_of(" \t\r\n"), contents.size()));
    if (contents.size() < 2) return std::nullopt;
    if (contents[0] == ':' && HexDigitValue(contents[1]) >= 0) return Format::IntelHex;
    if (contents[0] == 'S' && contents[1] >= '0' && contents[1] <= '9') return Format::SRecord;
    return std::nullopt;
}

Format ChooseFormat(const std::string& contents, const std::string& name,
                    const ReadOptions& options) {
    if (options.format) return *options.format;
    if (const auto detected = DetectFormat(contents)) return *detected;
    if (options.base) return Format::Binary;
    throw Failure(
        ExitStatus::BadFile,
        fmt::format("{}: no known format found (ELF, Intel HEX, S-record); if this is raw "
                    "binary, say where it goes with --base ADDRESS",
                    name));
}

Image ParseAs(Format format, const std::string& contents, const std::string& name,
              const ReadOptions& options) {
    switch (format) {
        case Format::Elf:
            return ParseElf(contents, name);
        case Format::IntelHex:
            return ParseIntelHex(contents, name);
        case Format::SRecord:
            return ParseSRecord(contents, name);
        case Format::Binary:
            break;
    }
    if (!options.base) {
        throw Failure(
            ExitStatus::WrongUsage,
            fmt::format("{}: raw binary has no address of its own; say where it goes with "
                        "--base ADDRESS",
                        name));
    }
    return ParseBinary(contents, name, *options.base);
}

}  // namespace

Image ParseImage(const std::string& contents, const std::string& name, const ReadOptions& options) {
    if (contents.empty()) {
        throw Failure(ExitStatus::BadFile,
                      fmt::format("{}: the file is empty; fetch or make it anew", name));
    }
    const Format format = ChooseFormat(contents, name, options);
    Image image = ParseAs(format, contents, name, options);
    if (image.Empty()) {
        throw Failure(ExitStatus::BadFile,
                      fmt::format("{}: no bytes to load found (read as {}); check that this is the "
                                  "linked program",
                                  name, FormatName(format)));
    }
    return image;
}

Image ReadImageFile(const std::string& path, const ReadOptions& options) {
    return ParseImage(File(path).Contents(), path, options);
}

}  // namespace host::image
