// FlashArray: the flash cells. Programming only clears bits, erasing only sets them. Pages that
// are erased take no memory, so that a large flash costs what was programmed into it.

#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <utility>
#include <vector>

#include "target/simulated/options/DeviceOptions.h"

namespace target {

class FlashArray {
  public:
    static constexpr std::uint32_t kPageSizeBytes = 1024;
    using Page = std::array<std::uint8_t, kPageSizeBytes>;
    using HeldPages = std::vector<std::pair<std::size_t, std::unique_ptr<Page>>>;

    /// sizeBytes is a multiple of the page size.
    FlashArray(std::uint32_t sizeBytes, std::optional<StuckCell> stuckCell);

    std::uint32_t SizeBytes() const { return sizeBytes_; }
    std::size_t PageCount() const { return pages_.size(); }

    /// Whether [address, address + sizeBytes) lies in the flash. All other operations demand it.
    bool Contains(std::uint64_t address, std::uint64_t sizeBytes) const;

    void Read(std::uint32_t address, std::span<std::uint8_t> bytes) const;

    /// Clears the bits that are 0 in `bytes`. Returns the address of the first byte that would
    /// have needed an erase first, if any.
    std::optional<std::uint32_t> Program(std::uint32_t address,
                                         std::span<const std::uint8_t> bytes);

    /// Sets all bits of the pages from `address` on; both numbers are multiples of the page size.
    /// Returns those that held something, with their index.
    HeldPages Erase(std::uint32_t address, std::uint32_t sizeBytes);

    /// How often a page was erased.
    std::uint32_t EraseCount(std::size_t index) const { return eraseCounts_[index]; }
    void PresetEraseCount(std::size_t index, std::uint32_t count) { eraseCounts_[index] = count; }

    /// Puts the bytes there, whatever the cells held before.
    void Preset(std::uint32_t address, std::span<const std::uint8_t> bytes);

    /// Null while the page is erased. Shows the cells without a stuck one.
    const Page* ProgrammedPage(std::size_t index) const { return pages_[index].get(); }

  private:
    Page& PageForChange(std::uint32_t address);

    const std::uint32_t sizeBytes_;
    const std::optional<StuckCell> stuckCell_;
    std::vector<std::unique_ptr<Page>> pages_;
    std::vector<std::uint32_t> eraseCounts_;  ///< of each page
};

}  // namespace target
