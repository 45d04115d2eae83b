// Joining ranges of addresses.

#include "base/AddressSet.h"

#include <algorithm>

namespace base {

void AddressSet::Add(const AddressRange& range) {
    // All from the first range that reaches up to this one to the last that begins in or behind it.
    const auto first = std::partition_point(
        ranges_.begin(), ranges_.end(),
        [&](const AddressRange& other) { return std::uint64_t{other.last} + 1 < range.first; });
    const auto behind = std::partition_point(first, ranges_.end(), [&](const AddressRange& other) {
        return other.first <= std::uint64_t{range.last} + 1;
    });
    if (first == behind) {
        ranges_.insert(first, range);
        return;
    }
    *first = {std::min(first->first, range.first), std::max((behind - 1)->last, range.last)};
    ranges_.erase(first + 1, behind);
}

std::uint64_t AddressSet::Bytes() const {
    std::uint64_t bytes = 0;
    for (const AddressRange& range : ranges_)
        bytes += range.Size();
    return bytes;
}

std::uint64_t AddressSet::BytesIn(const AddressRange& range) const {
    std::uint64_t bytes = 0;
    auto part =
        std::partition_point(ranges_.begin(), ranges_.end(),
                             [&](const AddressRange& other) { return other.last < range.first; });
    for (; part != ranges_.end() && part->first <= range.last; ++part)
        bytes += AddressRange{std::max(part->first, range.first), std::min(part->last, range.last)}
                     .Size();
    return bytes;
}

}  // namespace base
