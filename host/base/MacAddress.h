// A device's MAC address: its texts in all the forms that people write, and the two user registers
// that hold it, three bytes each, the first byte lowest.

#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>

namespace host {

struct MacAddress {
    std::array<std::uint8_t, 6> bytes{};

    bool operator==(const MacAddress&) const = default;

    /// "02-1b-c3-04-05-06": the only form that the plug-in programs.
    std::string Text() const;

    /// What user register 0 or 1 holds for this address.
    std::uint32_t Register(unsigned index) const;

    /// The address that the two registers hold, whose highest bytes don't belong to it.
    static MacAddress FromRegisters(std::uint32_t first, std::uint32_t second);

    /// Why no device should have this address, or an empty text.
    std::string Objection() const;
};

/// Six bytes separated by '-' or ':', each of one or two hexadecimal digits, or twelve digits
/// without separators. Nothing for any other text.
std::optional<MacAddress> ParseMacAddress(const std::string& text);

}  // namespace host
