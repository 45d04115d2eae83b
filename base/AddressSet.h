// AddressSet: the union of address ranges.

#pragma once

#include <cstdint>
#include <vector>

#include "base/AddressRange.h"

namespace base {

class AddressSet {
  public:
    /// Joins the range with what it overlaps or touches.
    void Add(const AddressRange& range);

    /// In address order; they neither overlap nor touch.
    const std::vector<AddressRange>& Ranges() const { return ranges_; }

    bool Empty() const { return ranges_.empty(); }
    std::uint64_t Bytes() const;

    /// How many bytes of a range are in the set.
    std::uint64_t BytesIn(const AddressRange& range) const;

    bool operator==(const AddressSet&) const = default;

  private:
    std::vector<AddressRange> ranges_;
};

}  // namespace base
