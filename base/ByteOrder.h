// Numbers as bytes in a fixed order, whatever the order of the machine that runs this. The target
// and GDB's protocol have the least significant byte first, the text records of images the most
// significant one.

#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

namespace base {

inline std::uint32_t LoadWord(const std::uint8_t* bytes) {
    return bytes[0] | std::uint32_t{bytes[1]} << 8 | std::uint32_t{bytes[2]} << 16 |
           std::uint32_t{bytes[3]} << 24;
}

inline void StoreWord(std::uint8_t* bytes, std::uint32_t value) {
    for (int i = 0; i < 4; ++i)
        bytes[i] = static_cast<std::uint8_t>(value >> (8 * i));
}

/// The same for a text of bytes, of which there must be four at least.
inline std::uint32_t WordOf(std::string_view bytes) {
    std::uint8_t word[4];
    for (std::size_t i = 0; i < sizeof word; ++i)
        word[i] = static_cast<std::uint8_t>(bytes[i]);
    return LoadWord(word);
}

inline std::string WordBytes(std::uint32_t value) {
    std::string bytes;
    for (int i = 0; i < 4; ++i)
        bytes += static_cast<char>(value >> (8 * i));
    return bytes;
}

/// The number of up to four bytes, the most significant one first.
inline std::uint32_t BigEndian(std::span<const std::uint8_t> bytes) {
    std::uint32_t value = 0;
    for (const std::uint8_t byte : bytes)
        value = value << 8 | byte;
    return value;
}

}  // namespace base
