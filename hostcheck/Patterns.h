// Bytes that tell where they belong, and the comparison that says where they differ.

#pragma once

#include "hostcheck/CheckedHost.h"

namespace hostcheck {

/// Bytes that differ from those of every neighbouring place, and of every block of 256.
inline Bytes Pattern(std::size_t bytes, unsigned salt = 0) {
    Bytes pattern(bytes);
    for (std::size_t i = 0; i < bytes; ++i)
        pattern[i] = static_cast<std::uint8_t>((i + salt) * 7 + i / 256);
    return pattern;
}

/// Breach with the first byte that differs.
inline void RequireEqual(const Bytes& came, const Bytes& expected, const std::string& doing) {
    if (came == expected) return;
    std::size_t at = 0;
    while (came[at] == expected[at])
        ++at;
    const auto from = [at](const Bytes& bytes) {
        return HexBytes({bytes.begin() + static_cast<std::ptrdiff_t>(at), bytes.end()});
    };
    throw Breach(from(came) + " instead of " + from(expected) + " at offset " + std::to_string(at) +
                 ", " + doing);
}

}  // namespace hostcheck
