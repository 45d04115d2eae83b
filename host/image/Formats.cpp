// The names and file name extensions of the formats, and the choice of a writer by format.

#include "host/image/Formats.h"

#include <algorithm>
#include <array>
#include <string_view>
#include <utility>

#include "base/system/Paths.h"
#include "host/base/Errors.h"

namespace host::image {
namespace {

constexpr std::array<std::pair<const char*, Format>, 4> kNames{{
    {"elf", Format::Elf},
    {"ihex", Format::IntelHex},
    {"srec", Format::SRecord},
    {"bin", Format::Binary},
}};

constexpr std::array<std::pair<std::string_view, Format>, 12> kExtensions{{
    {".elf", Format::Elf},
    {".axf", Format::Elf},
    {".hex", Format::IntelHex},
    {".ihex", Format::IntelHex},
    {".ihx", Format::IntelHex},
    {".mcs", Format::IntelHex},
    {".srec", Format::SRecord},
    {".s19", Format::SRecord},
    {".s28", Format::SRecord},
    {".s37", Format::SRecord},
    {".mot", Format::SRecord},
    {".mhx", Format::SRecord},
}};

char ToLower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

}  // namespace

const char* FormatName(Format format) {
    return std::ranges::find(kNames, format, &decltype(kNames)::value_type::second)->first;
}

std::optional<Format> FormatFromName(const std::string& name) {
    const auto found = std::ranges::find(kNames, name, &decltype(kNames)::value_type::first);
    return found == kNames.end() ? std::nullopt : std::optional(found->second);
}

Format FormatForWriting(const std::string& path) {
    std::string extension = base::NameOf(base::PathOf(path).extension());
    std::ranges::transform(extension, extension.begin(), ToLower);
    const auto found =
        std::ranges::find(kExtensions, extension, &decltype(kExtensions)::value_type::first);
    return found == kExtensions.end() ? Format::Binary : found->second;
}

std::string FormatImage(const Image& image, Format format) {
    switch (format) {
        case Format::Elf:
            break;
        case Format::IntelHex:
            return FormatIntelHex(image);
        case Format::SRecord:
            return FormatSRecord(image);
        case Format::Binary:
            return FormatBinary(image);
    }
    throw Failure(ExitStatus::WrongUsage,
                  "ELF can't be made from memory contents; write Intel HEX (.hex), S-records "
                  "(.srec) or raw binary (.bin)");
}

}  // namespace host::image
