// The forms of a MAC address, and what makes one unusable.

#include "host/base/MacAddress.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>

#include "base/Hex.h"
#include "host/base/Text.h"

namespace host {

namespace {

bool IsHexDigit(char c) {
    return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'f') || (c >= 'A' && c <= 'F');
}

/// How many hexadecimal digits of one byte stand at `position`: 0, 1 or 2.
std::size_t DigitsAt(const std::string& text, std::size_t position) {
    std::size_t count = 0;
    while (count < 2 && position + count < text.size() && IsHexDigit(text[position + count]))
        ++count;
    return count;
}

}  // namespace

std::string MacAddress::Text() const {
    return fmt::format("{:02x}", fmt::join(bytes, "-"));
}

std::uint32_t MacAddress::Register(unsigned index) const {
    const std::size_t first = std::size_t{3} * index;
    return std::uint32_t{bytes.at(first)} | std::uint32_t{bytes.at(first + 1)} << 8 |
           std::uint32_t{bytes.at(first + 2)} << 16;
}

MacAddress MacAddress::FromRegisters(std::uint32_t first, std::uint32_t second) {
    MacAddress address;
    for (unsigned i = 0; i < 3; ++i) {
        address.bytes.at(i) = static_cast<std::uint8_t>(first >> (8 * i));
        address.bytes.at(i + 3) = static_cast<std::uint8_t>(second >> (8 * i));
    }
    return address;
}

std::string MacAddress::Objection() const {
    const auto all = [this](std::uint8_t value) {
        return std::all_of(bytes.begin(), bytes.end(), [=](auto byte) { return byte == value; });
    };
    if (all(0x00)) return "is all zeros";
    if (all(0xFF)) return "is all ones, which is what erased registers hold";
    if (bytes[0] & 1) return "is a multicast address (the first byte is odd)";
    return {};
}

std::optional<MacAddress> ParseMacAddress(const std::string& text) {
    const bool separated = text.find_first_of("-:") != std::string::npos;
    const char separator = text.find('-') != std::string::npos ? '-' : ':';
    MacAddress address;
    std::size_t position = 0;
    for (std::size_t i = 0; i < address.bytes.size(); ++i) {
        if (separated && i > 0 && (position >= text.size() || text[position++] != separator))
            return std::nullopt;
        const std::size_t digits = DigitsAt(text, position);
        if (digits == 0 || (!separated && digits != 2)) return std::nullopt;
        address.bytes[i] =
            static_cast<std::uint8_t>(*base::ParseHex32(text.substr(position, digits)));
        position += digits;
    }
    if (position != text.size()) return std::nullopt;
    return address;
}

}  // namespace host
