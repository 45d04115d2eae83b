// Numbers, ranges and amounts as people write and read them on the command line. Nothing here
// depends on the global locale.

#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "base/AddressRange.h"

namespace host {

/// A hexadecimal number of up to 32 bits from the command line: a Failure (WrongUsage) that names
/// `what` for any other text.
std::uint32_t ParseHexArgument(const std::string& text, const std::string& what);

/// "A-B", two hexadecimal addresses, or "START+LENGTH". Failure (WrongUsage) for any other text and
/// for one without bytes.
base::AddressRange ParseRange(const std::string& text);

std::string RangeText(const base::AddressRange& range);  ///< "0x0-0x3ffff"
/// "0x0-0x3, 0x8-0xb and 0x10-0x13"
std::string RangesText(const std::vector<base::AddressRange>& ranges);
std::string SizeText(std::uint64_t bytes);  ///< "5.5 KiB", "256 KiB", "12 bytes"
std::string CountText(std::uint64_t count, const char* thing);  ///< "1 sector", "2 sectors"
std::string DurationText(double seconds);                       ///< "320 ms", "4.2 s", "2:05"

}  // namespace host
