// The commands of the flash controller, in the order: key, command, operand, work, end.

#include "target/simulated/FlashController.h"

#include <fmt/format.h>

#include <algorithm>

#include "target/simulated/options/DeviceClass.h"

namespace target {

namespace {

constexpr std::uint32_t kEraseSector = 0x2;
constexpr std::uint32_t kEraseAll = 0x4;
constexpr std::uint32_t kCommit = 0x8;

constexpr std::uint32_t kPrimaryKey = 0xA442;
constexpr std::uint32_t kAlternateKey = 0x71D5;
constexpr std::uint32_t kPrimaryKeyBit = 0x10;  // of the key configuration

constexpr std::uint32_t kCommitBase = 0x80000000;

// One bit of a flash block register stands for this much flash.
constexpr std::uint32_t kFlashBlockSizeBytes = 2048;
constexpr std::uint32_t kFlashBlockRegisters = 4;

}  // namespace

FlashController::FlashController(const DeviceOptions& options, RegisterFile& registers,
                                 FlashArray& flash, RuleLog& rules)
    : options_(options), registers_(registers), flash_(flash), rules_(rules) {}

void FlashController::Command(std::uint32_t value, bool coreRunning, Time now) {
    if (!TakesKey(value >> 16)) {
        rules_.Record(rule::kWriteKey,
                      fmt::format("Flash command 0x{:08X} ignored: wrong write key", value));
        return;
    }
    const std::uint32_t bit = value & 0xFFFF;
    if (bit != kEraseSector && bit != kEraseAll && bit != kCommit) {
        Refuse(rule::kKnownCommand,
               fmt::format("0x{:04X} is no command of the flash controller", bit));
    }
    if (IsBusy()) {
        Refuse(rule::kOneCommand,
               fmt::format("the flash controller still works on command 0x{:X}", running_->bit));
    }
    if (coreRunning && bit != kCommit) {
        Refuse(rule::kHaltedForErase, "the flash is erased under a running program");
    }
    if (bit == kEraseAll && BlocksBeyondFlashAreEnabled()) {
        rules_.Record(rule::kFlashBlocks,
                      "Mass erase ignored: the flash block registers enable blocks that the flash "
                      "doesn't have");
        return;
    }
    running_ = bit == kEraseSector ? SectorErase(now)
               : bit == kEraseAll  ? MassErase(now)
                                   : Commit(now);
}

bool FlashController::TakesKey(std::uint32_t key) const {
    const std::uint32_t configuration = registers_.Read(reg::kKeyConfiguration);
    const bool alternate = KindOf(options_) >= DeviceKind::Quen && configuration != 0 &&
                           (configuration & kPrimaryKeyBit) == 0;
    return key == (alternate ? kAlternateKey : kPrimaryKey);
}

FlashController::Running FlashController::SectorErase(Time now) const {
    const std::uint32_t address = registers_.Read(reg::kFlashAddress);
    if (!flash_.Contains(address, 1) || address % options_.sectorSizeBytes != 0) {
        Refuse(rule::kSectorAddress,
               fmt::format("the flash address register holds 0x{:08X}, which is not the start of a "
                           "0x{:X}-byte sector of the 0x{:X}-byte flash",
                           address, options_.sectorSizeBytes, flash_.SizeBytes()));
    }
    const std::uint32_t size = std::min(options_.sectorSizeBytes, flash_.SizeBytes() - address);
    return {kEraseSector, address, size, now + options_.timings.sectorErase};
}

FlashController::Running FlashController::MassErase(Time now) const {
    return {kEraseAll, 0, flash_.SizeBytes(), now + options_.timings.massErase};
}

FlashController::Running FlashController::Commit(Time now) const {
    const std::uint32_t operand = registers_.Read(reg::kFlashAddress);
    const std::uint32_t address = reg::kUserRegister0 + (operand - kCommitBase) * 4;
    if (operand < kCommitBase || operand > kCommitBase + 1 || !registers_.Has(address)) {
        Refuse(rule::kCommitAddress,
               fmt::format("the flash address register holds 0x{:08X}, which stands for no user "
                           "register of class {}",
                           operand, options_.className));
    }
    return {kCommit, address, 0, now + options_.timings.commit};
}

// The block registers cover more flash than a small device has. While a bit beyond its end is
// set, a mass erase doesn't start.
bool FlashController::BlocksBeyondFlashAreEnabled() const {
    if (!registers_.Has(reg::kFlashBlocks0)) return false;
    const std::uint32_t blocks = flash_.SizeBytes() / kFlashBlockSizeBytes;
    for (std::uint32_t i = 0; i < kFlashBlockRegisters; ++i) {
        const std::uint32_t first = i * 32;
        const std::uint32_t inFlash = std::clamp(blocks, first, first + 32) - first;
        const std::uint64_t beyond = 0xFFFFFFFFULL << inFlash & 0xFFFFFFFFULL;
        if ((registers_.Read(reg::kFlashBlocks0 + 4 * i) & beyond) != 0) return true;
    }
    return false;
}

void FlashController::AdvanceTo(Time now) {
    if (!running_) return;
    const bool commit = running_->bit == kCommit;
    const Faults& faults = options_.faults;
    if (commit ? faults.commitNeverEnds : faults.eraseNeverEnds) return;
    if (now < running_->end) return;
    if (commit) {
        registers_.SetResetValue(running_->address, registers_.Read(running_->address));
    } else {
        flash_.Erase(running_->address, running_->sizeBytes);
    }
    running_.reset();
}

void FlashController::Abort() {
    if (running_ && running_->bit != kCommit) {
        const std::uint32_t half = running_->sizeBytes / 2;
        flash_.Erase(running_->address, half - half % FlashArray::kPageSizeBytes);
    }
    running_.reset();
}

}  // namespace target
