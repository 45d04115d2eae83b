// SavedMemory: the contents of some of the target's RAM, to be put back.

#pragma once

#include <cstdint>
#include <vector>

#include "base/AddressSet.h"
#include "target/Target.h"

namespace host {

class SavedMemory {
  public:
    /// Reads the ranges; nothing was written when that fails. TargetError.
    SavedMemory(target::Target& target, base::AddressSet ranges);

    /// Writes back what was read, and looks whether it is there. TargetError.
    void PutBack() const;

    std::uint64_t Bytes() const { return ranges_.Bytes(); }

  private:
    target::Target& target_;
    base::AddressSet ranges_;
    std::vector<std::vector<std::uint8_t>> contents_;  ///< of each of the ranges
};

}  // namespace host
