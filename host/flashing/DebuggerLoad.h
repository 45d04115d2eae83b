// DebuggerLoad: the flash of a device as a debugger wants it, who sends erases and writes one by
// one, worked on by the same plan, load and comparison as "program".

#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "base/AddressSet.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/Sectors.h"
#include "host/image/Image.h"
#include "host/settings/SettingStore.h"
#include "target/gdb/probe/FlashProgrammer.h"

namespace host {

class DebuggerLoad final : public target::gdb::FlashProgrammer {
  public:
    /// Makes a device of the target that is lent, with these settings. Failure.
    using OpenDevice = std::function<std::unique_ptr<FlashDevice>(SettingStore& settings)>;
    using ScratchMemory = std::function<std::vector<base::AddressRange>()>;

    /// Identifies the device. TargetError.
    DebuggerLoad(OpenDevice open, ScratchMemory scratch, SettingStore settings);

    target::gdb::MemoryRegion Flash() const override;
    std::vector<base::AddressRange> Scratch() override { return scratch_(); }
    void Erase(std::uint32_t address, std::uint32_t sizeBytes) override;
    void Write(std::uint32_t address, std::string_view bytes) override;
    bool HasWork() const override { return finishedBytes_ >= batchBytes_; }
    void Work(const target::gdb::InterruptCheck& stop) override;
    void Done(const target::gdb::InterruptCheck& stop) override;
    bool Touches(const base::AddressRange& range) const override;
    void Overlay(std::uint32_t address, std::string& bytes) const override;
    std::string Abandon() override;
    std::string Report() const override;

  private:
    /// A sector to be erased, with what was written for it. Both are empty until the first write.
    struct Sector {
        std::vector<std::uint8_t> bytes = {};
        base::AddressSet written = {};
    };
    using Sectors = std::map<std::uint32_t, Sector>;  ///< by their first address

    /// What was done since the first erase.
    struct Totals {
        std::uint64_t programmedBytes = 0;
        std::uint64_t unchangedBytes = 0;
        std::uint64_t sectors = 0;
        std::chrono::duration<double> time{0};
    };

    template <typename Action>
    void Attempt(const target::gdb::InterruptCheck& stop, Action&& action);
    [[noreturn]] void Fail(const std::string& text);
    void Begin();
    FlashDevice& Device();
    base::AddressRange RangeOf(std::uint32_t sector) const;
    void RequireInFlash(std::uint32_t address, std::uint64_t sizeBytes) const;
    void CheckWrite(std::uint32_t address, std::string_view bytes);
    void CheckNotErased(std::uint32_t address, std::string_view bytes);
    void Program(Sectors&& sectors, const image::Image& loose);
    void EraseOnly(const std::vector<base::AddressRange>& runs);
    void Compare(const image::Image& contents);

    const OpenDevice open_;
    const ScratchMemory scratch_;
    const SettingStore chosen_;
    SettingStore settings_;                ///< of the device
    std::unique_ptr<FlashDevice> device_;  ///< for one load, or none after a failure
    FlashGeometry flash_;

    Sectors collected_;
    image::Image loose_;               ///< writes into flash that isn't to be erased
    std::uint64_t finishedBytes_ = 0;  ///< of sectors that the writes have left behind
    std::uint32_t writing_ = 0;        ///< the sector of the last byte that was written
    std::uint64_t batchBytes_;         ///< so many are programmed at once

    bool failed_ = false;
    Totals totals_;
    std::string report_;
};

}  // namespace host
