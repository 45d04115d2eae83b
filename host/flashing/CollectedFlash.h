// CollectedFlash: erases and writes of a debugger's load that aren't carried out yet, as a value.
// It knows the flash's sectors, and no device.

#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "base/AddressSet.h"
#include "host/flashing/Sectors.h"
#include "host/image/Image.h"

namespace host {

class CollectedFlash {
  public:
    /// A sector to be erased, with what was written for it. Both are empty until the first write.
    struct Sector {
        std::vector<std::uint8_t> bytes = {};
        base::AddressSet written = {};
    };
    using Sectors = std::map<std::uint32_t, Sector>;  ///< by their first address

    /// What the flash holds now.
    using ReadFlash = std::function<std::vector<std::uint8_t>(const base::AddressRange&)>;

    /// Where its bytes come from, for an image that gets them.
    static constexpr char kOrigin[] = "the debugger";

    CollectedFlash() = default;
    explicit CollectedFlash(const FlashGeometry& flash) : flash_(flash) {}

    /// Whole sectors, whose writes are forgotten. TargetError, here and below, for what can't be
    /// meant; nothing has changed then.
    void Erase(std::uint32_t address, std::uint32_t sizeBytes);

    /// Into sectors that are to be erased; elsewhere, over what is blank or already so.
    void Write(std::uint32_t address, std::string_view bytes, const ReadFlash& read);

    bool Empty() const { return sectors_.empty() && loose_.Empty(); }
    std::uint64_t SectorCount() const { return sectors_.size(); }

    /// Of sectors that the writes have left behind.
    std::uint64_t FinishedBytes() const { return finishedBytes_; }

    /// Takes out all sectors that were written, but the last one.
    Sectors TakeFinished();

    /// Takes out the sectors that are left, or the writes beside them.
    Sectors TakeSectors();
    image::Image TakeLoose();

    bool Touches(const base::AddressRange& range) const;

    /// Puts what is collected over what was read of the flash.
    void Overlay(std::uint32_t address, std::string& bytes) const;

    base::AddressRange RangeOf(std::uint32_t address) const {
        return SectorsCovering({address, address}, flash_);
    }

  private:
    template <typename Step>
    void ForEachSector(std::uint32_t address, std::string_view bytes, Step&& step) const;
    void RequireInFlash(std::uint32_t address, std::uint64_t sizeBytes) const;
    void RequireAsWritten(const Sector& sector, std::uint32_t first, std::uint32_t address,
                          std::string_view bytes) const;
    void RequireBlank(std::uint32_t address, std::string_view bytes, const ReadFlash& read) const;

    FlashGeometry flash_;
    Sectors sectors_;
    image::Image loose_;  ///< writes into flash that isn't to be erased
    std::uint64_t finishedBytes_ = 0;
    std::uint32_t writing_ = 0;  ///< the sector of the last byte that was written
};

}  // namespace host
