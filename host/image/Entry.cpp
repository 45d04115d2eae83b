// The address at which a program begins: in the header of ELF, and in a record of its own in the
// other formats. The records are valid, for the image was read from them before.

#include <string_view>

#include "base/Elf.h"
#include "base/Hex.h"
#include "host/image/Formats.h"

namespace host::image {
namespace {

std::optional<std::uint32_t> HexField(std::string_view record, std::size_t start,
                                      std::size_t digits) {
    return base::ParseHex32(record.substr(std::min(start, record.size()), digits));
}

/// Type 05 holds the address, type 03 a segment and an offset.
std::optional<std::uint32_t> OfIntelHex(std::string_view record) {
    if (record.substr(0, 1) != ":") return std::nullopt;
    const std::string_view type = record.substr(std::min<std::size_t>(7, record.size()), 2);
    if (type == "05") return HexField(record, 9, 8);
    const auto segment = HexField(record, 9, 4);
    const auto offset = HexField(record, 13, 4);
    if (type != "03" || !segment || !offset) return std::nullopt;
    return *segment * 16 + *offset;
}

/// S7, S8 and S9 end a file, with 32, 24 or 16 bits of address. Many tools write 0 for no entry.
std::optional<std::uint32_t> OfSRecord(std::string_view record) {
    const std::string_view type = record.substr(0, 2);
    const std::size_t digits = type == "S7" ? 8 : type == "S8" ? 6 : type == "S9" ? 4 : 0;
    if (digits == 0) return std::nullopt;
    const auto entry = HexField(record, 4, digits);
    return entry == std::uint32_t{0} ? std::nullopt : entry;
}

}  // namespace

std::optional<std::uint32_t> EntryOf(const std::string& contents, Format format) {
    if (format == Format::Binary) return std::nullopt;
    if (format == Format::Elf) return base::ReadElf(contents).entry;
    std::optional<std::uint32_t> entry;
    for (std::size_t start = 0; start < contents.size();) {
        const std::size_t end = std::min(contents.find_first_of("\r\n", start), contents.size());
        const std::string_view record = std::string_view(contents).substr(start, end - start);
        const auto found = format == Format::SRecord ? OfSRecord(record) : OfIntelHex(record);
        if (found) entry = found;
        start = end + 1;
    }
    return entry;
}

}  // namespace host::image
