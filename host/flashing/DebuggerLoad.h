// DebuggerLoad: the flash of a device as a debugger wants it, who sends erases and writes one by
// one, worked on by the same plan, load and comparison as "program".

#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "base/AddressRange.h"
#include "host/driver/FlashDevice.h"
#include "host/flashing/CollectedFlash.h"
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
    bool HasWork() const override;
    void Work(const target::gdb::InterruptCheck& stop) override;
    void Done(const target::gdb::InterruptCheck& stop) override;
    bool Touches(const base::AddressRange& range) const override {
        return collected_.Touches(range);
    }
    void Overlay(std::uint32_t address, std::string& bytes) const override {
        collected_.Overlay(address, bytes);
    }
    std::string Abandon() override;
    std::string Report() const override;

  private:
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
    bool HasBegun() const;
    void Begin();
    void GuessBatch();
    void SetBatch(double rate);
    FlashDevice& Device();
    void Program(CollectedFlash::Sectors&& sectors, const image::Image& loose);
    void EraseOnly(const std::vector<base::AddressRange>& runs);
    void Compare(const image::Image& contents);

    const OpenDevice open_;
    const ScratchMemory scratch_;
    const SettingStore chosen_;
    SettingStore settings_;                ///< of the device
    std::unique_ptr<FlashDevice> device_;  ///< for one load, or none after a failure
    FlashGeometry flash_;

    CollectedFlash collected_;
    std::uint64_t batchBytes_ = 0;  ///< so many are programmed at once; 0 as long as nobody knows

    bool failed_ = false;
    Totals totals_;
    std::string report_;
};

}  // namespace host
