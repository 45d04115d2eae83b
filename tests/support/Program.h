// A program of two sections, the first of three chunks. They share a sector of 1 KiB, and neither
// begins or ends with a block.

#pragma once

#include <algorithm>
#include <numeric>

#include "tests/support/RecordingHost.h"

namespace test {

struct Section {
    std::uint32_t address;
    std::uint32_t size;
};
inline constexpr Section kSections[] = {{0x13F0, 4200}, {0x24D4, 900}};

/// The bytes of a section: others in each version of the program.
inline std::vector<std::uint8_t> SectionBytes(std::uint32_t size, int version) {
    std::vector<std::uint8_t> bytes(size);
    std::iota(bytes.begin(), bytes.end(), static_cast<std::uint8_t>(3 + 0x55 * version));
    return bytes;
}

inline void PutProgram(std::vector<std::uint8_t>& flash, int version) {
    for (const auto [address, size] : kSections)
        std::ranges::copy(SectionBytes(size, version), flash.begin() + address);
}

/// What a host does to load it. The text is that of the first failing call.
inline std::string LoadProgram(Plugin& plugin, int version, bool endsLoad = true) {
    std::string error = TextOf(plugin->ResetSettings(0));
    for (const auto [address, size] : kSections) {
        if (!error.empty()) return error;
        const auto bytes = SectionBytes(size, version);
        error = TextOf(plugin->WriteDataToFlash(bytes.data(), address, size, 1));
    }
    return error.empty() && endsLoad ? TextOf(plugin->ResetSettings(2)) : error;
}

}  // namespace test
