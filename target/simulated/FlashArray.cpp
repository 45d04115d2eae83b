// Flash cells in lazily allocated pages.

#include "target/simulated/FlashArray.h"

#include <algorithm>

namespace target {

namespace {

// A page is either programmed and held, or erased and not there; a held page may be all ones as
// well.
constexpr std::uint8_t kErased = 0xFF;

std::uint32_t OffsetInPage(std::uint32_t address) {
    return address % FlashArray::kPageSizeBytes;
}

// Calls visit(address, part of bytes) once for each page that the bytes touch.
template <typename Byte, typename Visit>
void ForEachPart(std::uint32_t address, std::span<Byte> bytes, Visit&& visit) {
    while (!bytes.empty()) {
        const std::size_t room = FlashArray::kPageSizeBytes - OffsetInPage(address);
        const std::size_t size = std::min(room, bytes.size());
        visit(address, bytes.first(size));
        bytes = bytes.subspan(size);
        address += static_cast<std::uint32_t>(size);
    }
}

}  // namespace

FlashArray::FlashArray(std::uint32_t sizeBytes, std::optional<StuckCell> stuckCell)
    : sizeBytes_(sizeBytes),
      stuckCell_(stuckCell),
      pages_(sizeBytes / kPageSizeBytes),
      eraseCounts_(pages_.size()) {}

bool FlashArray::Contains(std::uint64_t address, std::uint64_t sizeBytes) const {
    return address <= sizeBytes_ && sizeBytes <= sizeBytes_ - address;
}

void FlashArray::Read(std::uint32_t address, std::span<std::uint8_t> bytes) const {
    ForEachPart(address, bytes, [this](std::uint32_t at, std::span<std::uint8_t> part) {
        const Page* page = ProgrammedPage(at / kPageSizeBytes);
        if (page == nullptr) {
            std::fill(part.begin(), part.end(), kErased);
        } else {
            std::copy_n(page->begin() + OffsetInPage(at), part.size(), part.begin());
        }
    });
    // The cell below keeps what it was told, so that contents survive a change of this fault.
    if (stuckCell_ && stuckCell_->address >= address &&
        stuckCell_->address - address < bytes.size()) {
        bytes[stuckCell_->address - address] = stuckCell_->value;
    }
}

// Everything is programmed, also behind the first cell that wasn't erased: silicon doesn't look.
std::optional<std::uint32_t> FlashArray::Program(std::uint32_t address,
                                                 std::span<const std::uint8_t> bytes) {
    std::optional<std::uint32_t> notErased;
    ForEachPart(address, bytes, [&](std::uint32_t at, std::span<const std::uint8_t> part) {
        std::uint8_t* cell = PageForChange(at).data() + OffsetInPage(at);
        for (const std::uint8_t byte : part) {
            if ((byte & ~*cell) != 0 && !notErased) notErased = at;
            *cell = static_cast<std::uint8_t>(*cell & byte);
            ++cell;
            ++at;
        }
    });
    return notErased;
}

// Erased pages are given away instead of being filled, which costs the same for any size.
FlashArray::HeldPages FlashArray::Erase(std::uint32_t address, std::uint32_t sizeBytes) {
    HeldPages held;
    const std::size_t first = address / kPageSizeBytes;
    for (std::size_t page = first; page < first + sizeBytes / kPageSizeBytes; ++page) {
        if (pages_[page] != nullptr) held.emplace_back(page, std::move(pages_[page]));
        ++eraseCounts_[page];
    }
    return held;
}

void FlashArray::Preset(std::uint32_t address, std::span<const std::uint8_t> bytes) {
    ForEachPart(address, bytes, [this](std::uint32_t at, std::span<const std::uint8_t> part) {
        std::copy(part.begin(), part.end(), PageForChange(at).begin() + OffsetInPage(at));
    });
}

FlashArray::Page& FlashArray::PageForChange(std::uint32_t address) {
    std::unique_ptr<Page>& page = pages_[address / kPageSizeBytes];
    if (page == nullptr) {
        page = std::make_unique<Page>();
        page->fill(kErased);
    }
    return *page;
}

}  // namespace target
