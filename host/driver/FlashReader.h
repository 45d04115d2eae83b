// What those need of a device who only look at its flash.

#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

#include "base/AddressRange.h"

namespace host {

class FlashReader {
  public:
    /// Whether the byte at an address lies in flash.
    virtual bool Contains(std::uint32_t address) = 0;

    /// Halts the target, as reading flash demands.
    virtual void Halt() = 0;

    /// The contents of a range in flash.
    virtual std::vector<std::uint8_t> ReadFlash(const base::AddressRange& range) = 0;

    /// Whether flash holds these bytes, by their CRC-32; nothing where that isn't known without
    /// reading them. Counts them for the running phase when it does.
    virtual std::optional<bool> HoldsByChecksum(std::uint32_t address,
                                                std::span<const std::uint8_t> bytes) = 0;

  protected:
    ~FlashReader() = default;
};

}  // namespace host
