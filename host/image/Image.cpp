// Keeping the sections of an image in order, joined and free of contradictions.

#include "host/image/Image.h"

#include <fmt/format.h>

#include <algorithm>
#include <iterator>
#include <numeric>
#include <span>
#include <utility>

#include "host/base/Errors.h"
#include "host/base/Text.h"

namespace host::image {
namespace {

constexpr std::uint64_t kAddressSpaceBytes = 0x1'0000'0000;

void RequireInAddressSpace(std::uint64_t address, std::size_t size, const std::string& origin) {
    if (address + size > kAddressSpaceBytes) {
        throw Failure(ExitStatus::BadFile,
                      fmt::format("{}: {} at address {:#x} run past 0xffffffff; check the "
                                  "load address",
                                  origin, CountText(size, "byte"), address));
    }
}

void RequireEqualOverlap(const Section& present, const Section& added, const std::string& origin) {
    const std::uint64_t begin = std::max(present.address, added.address);
    const std::uint64_t end = std::min(present.End(), added.End());
    if (begin >= end) return;
    const auto part = [&](const Section& section) {
        return std::span(section.bytes).subspan(begin - section.address, end - begin);
    };
    const auto [had, wants] = std::ranges::mismatch(part(present), part(added));
    if (had == part(present).end()) return;
    throw Failure(ExitStatus::BadFile,
                  fmt::format("{} puts {:#04x} at address {:#x}, where {:#04x} stands already; "
                              "leave one of the two out",
                              origin, *wants,
                              begin + static_cast<std::size_t>(had - part(present).begin()), *had));
}

/// Makes room as appending would, so that many small additions cost no more than one large one.
void ReserveUntil(Section& section, std::uint64_t end) {
    const std::size_t needed = end - section.address;
    if (needed > section.bytes.capacity()) {
        section.bytes.reserve(std::max(needed, 2 * section.bytes.capacity()));
    }
}

/// Appends what `more` has behind the end of `section`.
void AppendTail(Section& section, const Section& more) {
    if (more.End() <= section.End()) return;
    const auto known = static_cast<std::ptrdiff_t>(section.End() - more.address);
    section.bytes.insert(section.bytes.end(), more.bytes.begin() + known, more.bytes.end());
}

}  // namespace

void Image::Add(std::uint32_t address, std::vector<std::uint8_t> bytes, const std::string& origin) {
    if (bytes.empty()) return;
    RequireInAddressSpace(address, bytes.size(), origin);
    Section added{address, std::move(bytes)};

    // From here on, `first` to `last` are the sections that overlap or touch the new bytes.
    const auto first = std::ranges::partition_point(
        sections_, [&](const Section& section) { return section.End() < added.address; });
    const auto last = std::partition_point(first, sections_.end(), [&](const Section& section) {
        return section.address <= added.End();
    });
    std::for_each(first, last,
                  [&](const Section& section) { RequireEqualOverlap(section, added, origin); });
    if (first == last) {
        sections_.insert(first, std::move(added));
        return;
    }

    // All memory is had before anything is changed.
    const std::uint64_t end = std::max(added.End(), std::prev(last)->End());
    if (added.address < first->address) {
        ReserveUntil(added, end);
        std::swap(*first, added);
    } else {
        ReserveUntil(*first, end);
    }
    AppendTail(*first, added);
    std::for_each(std::next(first), last, [&](const Section& next) { AppendTail(*first, next); });
    sections_.erase(std::next(first), last);
}

void Image::Add(const Image& other, const std::string& origin) {
    Image joined = *this;
    for (const Section& section : other.sections_) {
        joined.Add(section.address, section.bytes, origin);
    }
    *this = std::move(joined);
}

std::uint64_t Image::ByteCount() const {
    return std::transform_reduce(sections_.begin(), sections_.end(), std::uint64_t{0},
                                 std::plus<>(),
                                 [](const Section& section) { return section.bytes.size(); });
}

}  // namespace host::image
