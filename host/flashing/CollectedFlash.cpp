// Checked first, then changed, sector by sector.

#include "host/flashing/CollectedFlash.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

#include "host/base/Text.h"
#include "host/flashing/Unchanged.h"
#include "target/Target.h"

namespace host {

namespace {

using target::TargetError;

std::string RangeOfBytes(std::uint32_t address, std::uint64_t sizeBytes) {
    return fmt::format("{} at {:#x}", CountText(sizeBytes, "byte"), address);
}

}  // namespace

/// Calls `step` with each sector's first address, and the part of the bytes that it has.
template <typename Step>
void CollectedFlash::ForEachSector(std::uint32_t address, std::string_view bytes,
                                   Step&& step) const {
    while (!bytes.empty()) {
        const base::AddressRange sector = RangeOf(address);
        const std::size_t size = std::min<std::size_t>(bytes.size(), sector.last - address + 1);
        step(sector.first, address, bytes.substr(0, size));
        bytes.remove_prefix(size);
        address += static_cast<std::uint32_t>(size);
    }
}

void CollectedFlash::RequireInFlash(std::uint32_t address, std::uint64_t sizeBytes) const {
    if (address + sizeBytes <= flash_.flashBytes) return;
    throw TargetError(fmt::format("{} don't lie in the flash, {}", RangeOfBytes(address, sizeBytes),
                                  SizeText(flash_.flashBytes)));
}

void CollectedFlash::Erase(std::uint32_t address, std::uint32_t sizeBytes) {
    const std::uint32_t sector = flash_.sectorBytes;
    if (address % sector != 0 || sizeBytes % sector != 0)
        throw TargetError(fmt::format("erasing {}: whole sectors of {} are erased",
                                      RangeOfBytes(address, sizeBytes), SizeText(sector)));
    if (sizeBytes == 0) return;
    // The flash may end inside its last sector, which is erased whole.
    RequireInFlash(address, std::uint64_t{sizeBytes} - (sector - 1));
    base::AddressSet erased;
    for (std::uint64_t at = address; at < std::uint64_t{address} + sizeBytes; at += sector) {
        const auto first = static_cast<std::uint32_t>(at);
        sectors_[first] = {};
        erased.Add(RangeOf(first));
    }
    if (!loose_.Empty()) loose_ = Without(loose_, erased);
}

void CollectedFlash::Write(std::uint32_t address, std::string_view bytes, const ReadFlash& read) {
    RequireInFlash(address, bytes.size());
    ForEachSector(address, bytes, [&](auto first, auto at, auto part) {
        const auto sector = sectors_.find(first);
        if (sector == sectors_.end())
            RequireBlank(at, part, read);
        else
            RequireAsWritten(sector->second, first, at, part);
    });
    ForEachSector(address, bytes, [&](auto first, auto at, auto part) {
        const auto found = sectors_.find(first);
        if (found == sectors_.end()) return loose_.Add(at, {part.begin(), part.end()}, kOrigin);
        Sector& sector = found->second;
        if (sector.bytes.empty()) sector.bytes.resize(RangeOf(first).Size(), 0xFF);
        std::ranges::copy(part, sector.bytes.begin() + (at - first));
        sector.written.Add({at, at + static_cast<std::uint32_t>(part.size() - 1)});
        if (first != writing_ && sectors_.contains(writing_))
            finishedBytes_ += sectors_[writing_].written.Bytes();
        writing_ = first;
    });
}

void CollectedFlash::RequireAsWritten(const Sector& sector, std::uint32_t first,
                                      std::uint32_t address, std::string_view bytes) const {
    for (const base::AddressRange& written : sector.written.Ranges())
        for (std::uint64_t i = std::max(address, written.first);
             i <= written.last && i < std::uint64_t{address} + bytes.size(); ++i)
            if (sector.bytes[i - first] != static_cast<std::uint8_t>(bytes[i - address]))
                throw TargetError(
                    fmt::format("writing {}: {:#x} was written before, with another value",
                                RangeOfBytes(address, bytes.size()), i));
}

void CollectedFlash::RequireBlank(std::uint32_t address, std::string_view bytes,
                                  const ReadFlash& read) const {
    const auto held = read({address, static_cast<std::uint32_t>(address + bytes.size() - 1)});
    std::string over(held.begin(), held.end());
    Overlay(address, over);
    for (std::size_t i = 0; i < bytes.size(); ++i)
        if (over[i] != '\xFF' && over[i] != bytes[i])
            throw TargetError(fmt::format("writing {}: {:#x} isn't blank, and wasn't erased",
                                          RangeOfBytes(address, bytes.size()), address + i));
}

CollectedFlash::Sectors CollectedFlash::TakeFinished() {
    finishedBytes_ = 0;
    Sectors finished;
    for (auto sector = sectors_.begin(); sector != sectors_.end();) {
        const auto next = std::next(sector);
        if (sector->first != writing_ && !sector->second.written.Empty())
            finished.insert(sectors_.extract(sector));
        sector = next;
    }
    return finished;
}

CollectedFlash::Sectors CollectedFlash::TakeSectors() {
    finishedBytes_ = 0;
    return std::exchange(sectors_, {});
}

image::Image CollectedFlash::TakeLoose() {
    return std::exchange(loose_, {});
}

bool CollectedFlash::Touches(const base::AddressRange& range) const {
    if (range.first >= flash_.flashBytes) return false;
    const auto sector = sectors_.lower_bound(RangeOf(range.first).first);
    if (sector != sectors_.end() && sector->first <= range.last) return true;
    return std::ranges::any_of(loose_.Sections(), [&](const image::Section& section) {
        return section.address <= range.last && section.Last() >= range.first;
    });
}

void CollectedFlash::Overlay(std::uint32_t address, std::string& bytes) const {
    const auto put = [&](std::uint32_t first, const std::vector<std::uint8_t>& over) {
        for (std::size_t i = first < address ? address - first : 0;
             i < over.size() && first + i - address < bytes.size(); ++i)
            bytes[first + i - address] = static_cast<char>(over[i]);
    };
    for (const image::Section& section : loose_.Sections())
        put(section.address, section.bytes);
    if (address >= flash_.flashBytes) return;
    const std::vector<std::uint8_t> blank(flash_.sectorBytes, 0xFF);
    for (auto sector = sectors_.lower_bound(RangeOf(address).first);
         sector != sectors_.end() && sector->first < address + std::uint64_t{bytes.size()};
         ++sector)
        put(sector->first, sector->second.bytes.empty() ? blank : sector->second.bytes);
}

}  // namespace host
