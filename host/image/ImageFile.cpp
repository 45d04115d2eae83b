// Reading an image file: getting its contents, telling its format, and calling the right reader.

#include <fmt/format.h>

#include <string_view>

#include "base/Elf.h"
#include "base/Hex.h"
#include "host/base/Errors.h"
#include "host/files/InputFile.h"
#include "host/image/Formats.h"

namespace host::image {
namespace {

const std::string kStandardInput = "standard input";

std::optional<Format> DetectFormat(std::string_view contents) {
    if (base::LooksLikeElf(contents)) return Format::Elf;
    contents.remove_prefix(std::min(contents.find_first_not_of(" \t\r\n"), contents.size()));
    if (contents.size() < 2) return std::nullopt;
    if (contents[0] == ':' && base::HexDigitValue(contents[1]) >= 0) return Format::IntelHex;
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

ImageFile ReadImageFile(const std::string& path, const ReadOptions& options) {
    InputFile file(kImageFile, path);
    const std::string& name = path == "-" ? kStandardInput : path;
    const Format format =
        file.Beginning().empty() ? Format::Binary : ChooseFormat(file.Beginning(), name, options);
    // What isn't known to be text or ELF holds no more than the bytes themselves.
    const bool binary = format == Format::Binary;
    const std::string contents = file.Contents(binary ? kFlashBytesMax : kImageFile.maxBytes);
    Image image = ParseImage(contents, name, {format, options.base});
    return {std::move(image), format, EntryOf(contents, format)};
}

}  // namespace host::image
