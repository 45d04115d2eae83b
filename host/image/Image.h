// Image: the bytes that a file wants to have in a device's memory, as sections in address order
// that neither overlap nor touch; and the files that images are read from and written to.

#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "host/files/FileKind.h"

namespace host::image {

using Bytes = std::span<const std::uint8_t>;

/// The largest flash of a device has this many bytes: 16 bits count it in units of 2 KiB.
inline constexpr std::uint64_t kFlashBytesMax = std::uint64_t{128} << 20;

/// Text needs two digits a byte, and as much again for what stands around them; ELF files hold
/// debugging information as well.
inline constexpr FileKind kImageFile{"image file", ExitStatus::BadFile, 4 * kFlashBytesMax, true};

/// A run of bytes at consecutive addresses; never empty inside an Image.
struct Section {
    std::uint32_t address = 0;
    std::vector<std::uint8_t> bytes;

    /// The address of the last byte.
    std::uint32_t Last() const { return address + static_cast<std::uint32_t>(bytes.size() - 1); }

    /// The address behind the last byte, which may be the one behind the 32-bit address space.
    std::uint64_t End() const { return std::uint64_t{address} + bytes.size(); }

    bool operator==(const Section&) const = default;
};

class Image {
  public:
    /// Adds bytes at an address, joining sections that now touch. Bytes that are there already
    /// must be equal: otherwise a Failure (BadFile) names the first address that differs, both
    /// values and `origin`, what the new bytes come from ("segment 2 of boot.elf"). A range that
    /// runs past 0xFFFFFFFF is a Failure as well. No bytes add nothing. Whatever is thrown, the
    /// image is unchanged. Adding behind the last byte of a section costs amortized time in
    /// proportion to the new bytes; adding before or between sections moves what lies behind.
    void Add(std::uint32_t address, std::vector<std::uint8_t> bytes, const std::string& origin);

    /// Adds every section of another image, or none if one of them cannot be added.
    void Add(const Image& other, const std::string& origin);

    const std::vector<Section>& Sections() const { return sections_; }
    bool Empty() const { return sections_.empty(); }
    std::uint64_t ByteCount() const;

    bool operator==(const Image&) const = default;

  private:
    std::vector<Section> sections_;
};

enum class Format { Elf, IntelHex, SRecord, Binary };

/// The name of a format as the command line spells it: "elf", "ihex", "srec", "bin".
const char* FormatName(Format format);

/// The format of that name, if there is one.
std::optional<Format> FormatFromName(const std::string& name);

struct ReadOptions {
    std::optional<Format> format;       ///< instead of what the contents say
    std::optional<std::uint32_t> base;  ///< load address of raw binary; the others have their own
};

struct ImageFile {
    Image image;
    Format format;
    std::optional<std::uint32_t> entry;  ///< where the file says that its program begins
};

/// Reads an image file; "-" is standard input. The format is told from the contents; raw binary has
/// no mark of its own and is assumed for a file of no known format only when `options.base` is
/// given. A missing, unreadable, truncated or contradictory file, and one without any bytes to
/// load, is a Failure (BadFile) that names the file, the line or segment, and what to do. Asking
/// for raw binary without a base is a Failure (WrongUsage).
ImageFile ReadImageFile(const std::string& path, const ReadOptions& options);

/// The same from a file's contents; `name` stands for the file in error texts.
Image ParseImage(const std::string& contents, const std::string& name, const ReadOptions& options);

/// The format that a file name's extension asks for; raw binary for any that isn't known.
Format FormatForWriting(const std::string& path);

/// The bytes as people read them, line by line.
std::string FormatDump(const Image& image);

/// The contents of a file of that format. Raw binary fills the gaps between sections with 0xFF
/// and starts with the first section's first byte; sections spread over more than 256 MiB cannot
/// be written so, and ELF cannot be written at all (Failure, WrongUsage).
std::string FormatImage(const Image& image, Format format);

}  // namespace host::image
