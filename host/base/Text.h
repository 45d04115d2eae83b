// Numbers, ranges and amounts as people write and read them on the command line. Nothing here
// depends on the global locale.

#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace host {

/// Target addresses from first to last, both included.
struct AddressRange {
    std::uint32_t first = 0;
    std::uint32_t last = 0;

    std::uint64_t Size() const { return std::uint64_t{last} - first + 1; }
    bool Contains(std::uint32_t address) const { return first <= address && address <= last; }
    bool operator==(const AddressRange&) const = default;
};

/// A whole text that is a hexadecimal number of up to 32 bits, with or without "0x".
std::optional<std::uint32_t> HexNumber(const std::string& text);

/// The same from the command line: a Failure (WrongUsage) that names `what` for any other text.
std::uint32_t ParseHexArgument(const std::string& text, const std::string& what);

/// "A-B", two hexadecimal addresses, or "START+LENGTH". Failure (WrongUsage) for any other text and
/// for one without bytes.
AddressRange ParseRange(const std::string& text);

std::string HexText(std::uint32_t value);          ///< "0x3ffff"
std::string RangeText(const AddressRange& range);  ///< "0x0-0x3ffff"
std::string SizeText(std::uint64_t bytes);         ///< "5.5 KiB", "256 KiB", "12 bytes"
std::string CountText(std::uint64_t count, const char* thing);  ///< "1 sector", "2 sectors"
std::string DurationText(double seconds);                       ///< "320 ms", "4.2 s", "2:05"

}  // namespace host
