// AddressRange: target addresses from first to last, both included.

#pragma once

#include <cstdint>

namespace base {

/// Never empty: `first` is at most `last`. All 2^32 addresses are a range, so sizes need 64 bits.
struct AddressRange {
    std::uint32_t first = 0;
    std::uint32_t last = 0;

    std::uint64_t Size() const { return std::uint64_t{last} - first + 1; }
    bool Contains(std::uint32_t address) const { return first <= address && address <= last; }
    bool operator==(const AddressRange&) const = default;
};

}  // namespace base
