// Comparing flash with what it should hold.

#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "host/base/Json.h"
#include "host/image/Image.h"

namespace host {

class FlashDevice;

struct Difference {
    std::uint32_t address = 0;  ///< of the first byte that differs
    std::uint8_t expected = 0;
    std::uint8_t actual = 0;
    std::uint64_t count = 0;
    bool notErased = false;  ///< some bit that should be 1 is 0: only an erase can mend that

    bool operator==(const Difference&) const = default;
};

/// Adds what differs between two runs of bytes at an address to the difference found so far.
void Compare(std::optional<Difference>& difference, std::uint32_t address,
             std::span<const std::uint8_t> expected, std::span<const std::uint8_t> actual);

/// Reads all that the image covers and compares. The target is halted first.
std::optional<Difference> CompareWithFlash(FlashDevice& device, const image::Image& image);

/// One line: where, what, how many, and what to try.
std::string Describe(const Difference& difference);

Json ToJson(const Difference& difference);

}  // namespace host
