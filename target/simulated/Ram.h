// Ram: the target's static memory, which debugger and loader share. Words are little-endian,
// whatever the machine that runs the simulation.

#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "base/ByteOrder.h"

namespace target {

class Ram {
  public:
    static constexpr std::uint32_t kStart = 0x20000000;

    /// Powers up as all ones, which a loader's status word that nobody has set shows as busy.
    explicit Ram(std::uint32_t sizeBytes) : bytes_(sizeBytes, 0xFF) {}

    bool Contains(std::uint64_t address, std::uint64_t sizeBytes) const {
        return address >= kStart && address - kStart <= bytes_.size() &&
               sizeBytes <= bytes_.size() - (address - kStart);
    }

    /// The bytes of a range that lies in the RAM.
    std::span<std::uint8_t> Bytes(std::uint32_t address, std::size_t sizeBytes) {
        return std::span(bytes_).subspan(address - kStart, sizeBytes);
    }

    std::uint32_t Word(std::uint32_t address) { return base::LoadWord(Bytes(address, 4).data()); }
    void SetWord(std::uint32_t address, std::uint32_t value) {
        base::StoreWord(Bytes(address, 4).data(), value);
    }

    void LosePower() { bytes_.assign(bytes_.size(), 0xFF); }

  private:
    std::vector<std::uint8_t> bytes_;
};

}  // namespace target
