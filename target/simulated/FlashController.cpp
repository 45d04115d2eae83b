// The commands of the flash controller, in the order: registers, key, what may lose a command,
// operand, work, end.

#include "target/simulated/FlashController.h"

#include <fmt/format.h>

#include <algorithm>

#include "target/simulated/options/DeviceClass.h"

namespace target {

namespace {

using namespace std::chrono_literals;
using Time = FlashController::Time;

// States: idle, or at work on one command (running_). Besides, and only ended by a reset, erase
// mode (inEraseMode_). A command begins in Command and nowhere else; it ends in AdvanceTo when its
// time is up, or in Reset. Erased cells change at the end, never in between.

constexpr std::uint32_t kEraseSector = 0x2;
constexpr std::uint32_t kEraseAll = 0x4;
constexpr std::uint32_t kCommit = 0x8;

constexpr std::uint32_t kPrimaryKey = 0xA442;
constexpr std::uint32_t kAlternateKey = 0x71D5;
constexpr std::uint32_t kPrimaryKeyBit = 0x10;  // of the key configuration

constexpr std::uint32_t kCommitBase = 0x80000000;

// A mass erase works on all that lies below the end of the bank that it is given. There are two.
constexpr std::uint32_t kLowerBank = 0;
constexpr std::uint32_t kUpperBank = 0x20000;

// One bit of a flash block register stands for this much flash.
constexpr std::uint32_t kFlashBlockSizeBytes = 2048;
constexpr std::uint32_t kFlashBlockRegisters = 4;

// What the charge pump and the address latches need. The rest of the silicon is faster.
constexpr Time kAddressSetUp = 4ms;   // of a sector, before its erase
constexpr Time kEraseRecovery = 4ms;  // after a sector, before the next address
constexpr Time kBlockWrite = 8ms;     // of a flash block register
constexpr Time kSectorStatus = 4ms;   // until the status shows a sector's erase
constexpr Time kMassStatus = 8ms;     // and one of the whole flash

Time StatusDelay(std::uint32_t bit) {
    return bit == kEraseSector ? kSectorStatus : bit == kEraseAll ? kMassStatus : Time(0);
}

}  // namespace

FlashController::FlashController(const DeviceOptions& options, RegisterFile& registers,
                                 SystemControl& system, FlashArray& flash, RuleLog& rules)
    : options_(options),
      registers_(registers),
      system_(system),
      flash_(flash),
      rules_(rules),
      unsettled_(flash) {}

bool FlashController::Owns(std::uint32_t address) {
    return address == reg::kFlashAddress || address == reg::kFlashCommand ||
           (address >= reg::kFlashBlocks0 &&
            address < reg::kFlashBlocks0 + 4 * kFlashBlockRegisters);
}

void FlashController::Write(std::uint32_t address, std::uint32_t value, CoreState core, Time now) {
    if (address == reg::kFlashAddress) return WriteAddress(value, now);
    if (address == reg::kFlashCommand) return Command(value, core, now);
    WriteBlocks(address, value, now);
}

// A lost address leaves the old one, which the next command then works on.
void FlashController::WriteAddress(std::uint32_t value, Time now) {
    const auto lost = [&](const char* ruleName, const char* why) {
        rules_.Record(ruleName, fmt::format("Flash address {:#x} lost: {}", value, why));
    };
    if (IsBusy()) return lost(rule::kOneCommand, "a command is at work");
    if (!system_.IsClockStable(now))
        return lost(rule::kClockSettling, "the clock was switched too short a time before");
    if (sectorErased_ && now < *sectorErased_ + kEraseRecovery)
        return lost(rule::kEraseRecovery, "a sector's erase ended too short a time before");
    registers_.Write(reg::kFlashAddress, value);
    addressWritten_ = now;
}

void FlashController::WriteBlocks(std::uint32_t address, std::uint32_t value, Time now) {
    if (now < blocksReady_) {
        return rules_.Record(rule::kBlockWrite,
                             fmt::format("Flash blocks {:#x} lost: the last word of these "
                                         "registers is still being written",
                                         value));
    }
    registers_.Write(address, value);
    blocksReady_ = now + kBlockWrite;
}

void FlashController::Command(std::uint32_t value, CoreState core, Time now) {
    if (!TakesKey(value >> 16)) {
        rules_.Record(rule::kWriteKey,
                      fmt::format("Flash command {:#010x} ignored: wrong write key", value));
        return;
    }
    // From here on the key was right, so that somebody meant it: what makes no sense is refused.
    const std::uint32_t bit = value & 0xFFFF;
    if (bit != kEraseSector && bit != kEraseAll && bit != kCommit) {
        Refuse(rule::kKnownCommand,
               fmt::format("0x{:04X} is no command of the flash controller", bit));
    }
    if (IsBusy()) {
        Refuse(rule::kOneCommand,
               fmt::format("the flash controller still works on command 0x{:X}", running_->bit));
    }
    if (core != CoreState::Halted && bit != kCommit) {
        Refuse(rule::kHaltedForErase, "the flash is erased under a running program");
    }
    if (const auto obstacle = WhyCommandIsLost(bit, now)) {
        rules_.Record(obstacle->rule,
                      fmt::format("Flash command {:#010x} lost: {}", value, obstacle->why));
        return;
    }
    running_ = bit == kEraseSector ? SectorErase(now)
               : bit == kEraseAll  ? MassErase(now)
                                   : Commit(now);
}

// Two keys from Quen on. A configuration that reads 0 isn't there, and asks for nothing.
bool FlashController::TakesKey(std::uint32_t key) const {
    const std::uint32_t configuration = registers_.Read(reg::kKeyConfiguration);
    const bool alternate = KindOf(options_) >= DeviceKind::Quen && configuration != 0 &&
                           (configuration & kPrimaryKeyBit) == 0;
    return key == (alternate ? kAlternateKey : kPrimaryKey);
}

// A commit works on cells of its own, which need none of this.
std::optional<Obstacle> FlashController::WhyCommandIsLost(std::uint32_t bit, Time now) const {
    if (bit == kCommit) return std::nullopt;
    if (const auto obstacle = system_.WhyFlashIsNotReady()) return obstacle;
    if (bit == kEraseSector) {
        if (addressWritten_ && now < *addressWritten_ + kAddressSetUp) {
            return Obstacle{rule::kAddressSetUp, "it came too soon after the address"};
        }
        return std::nullopt;
    }
    if (!IsBank(registers_.Read(reg::kFlashAddress))) {
        return Obstacle{rule::kBank, "the flash address register holds the start of no bank"};
    }
    // The blocks decide before the time of their writing: what was lost isn't being written.
    if (BlocksBeyondFlashAreEnabled()) {
        return Obstacle{rule::kFlashBlocks,
                        "the flash block registers enable blocks that the flash doesn't have"};
    }
    if (now < blocksReady_) {
        return Obstacle{rule::kBlockWrite, "the flash block registers are still being written"};
    }
    return std::nullopt;
}

FlashController::Running FlashController::SectorErase(Time now) const {
    const std::uint32_t address = registers_.Read(reg::kFlashAddress);
    if (!flash_.Contains(address, 1) || address % options_.sectorSizeBytes != 0) {
        Refuse(rule::kSectorAddress,
               fmt::format("the flash address register holds {:#x}, which is not the start of a "
                           "0x{:X}-byte sector of the 0x{:X}-byte flash",
                           address, options_.sectorSizeBytes, flash_.SizeBytes()));
    }
    const std::uint32_t size = std::min(options_.sectorSizeBytes, flash_.SizeBytes() - address);
    return {kEraseSector, address, size, now, now + options_.timings.sectorErase};
}

// Up to the end of the bank; the upper one ends where the flash does.
FlashController::Running FlashController::MassErase(Time now) const {
    const bool lower = registers_.Read(reg::kFlashAddress) == kLowerBank;
    const std::uint32_t size =
        lower ? std::min(kUpperBank, flash_.SizeBytes()) : flash_.SizeBytes();
    return {kEraseAll, 0, size, now, now + options_.timings.massErase};
}

FlashController::Running FlashController::Commit(Time now) const {
    const std::uint32_t operand = registers_.Read(reg::kFlashAddress);
    const std::uint32_t address = reg::kUserRegister0 + (operand - kCommitBase) * 4;
    if (operand < kCommitBase || operand > kCommitBase + 1 || !registers_.Has(address)) {
        Refuse(rule::kCommitAddress,
               fmt::format("the flash address register holds {:#x}, which stands for no user "
                           "register of class {}",
                           operand, options_.className));
    }
    return {kCommit, address, 0, now, now + options_.timings.commit};
}

bool FlashController::IsBank(std::uint32_t address) const {
    return address == kLowerBank || (address == kUpperBank && flash_.Contains(address, 1));
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

// What lies beyond the registers' reach is always enabled.
bool FlashController::IsBlockEnabled(std::uint32_t address) const {
    const std::uint32_t block = address / kFlashBlockSizeBytes;
    if (!registers_.Has(reg::kFlashBlocks0) || block >= 32 * kFlashBlockRegisters) return true;
    return (registers_.Read(reg::kFlashBlocks0 + block / 32 * 4) >> block % 32 & 1) != 0;
}

void FlashController::EraseEnabledBlocks(const Running& erase, Time now) {
    if (!registers_.Has(reg::kFlashBlocks0)) {
        return unsettled_.Erase(erase.address, erase.sizeBytes, now);
    }
    const std::uint32_t end = erase.address + erase.sizeBytes;
    for (std::uint32_t start = erase.address; start < end;) {
        const std::uint32_t next =
            std::min(end, (start / kFlashBlockSizeBytes + 1) * kFlashBlockSizeBytes);
        if (IsBlockEnabled(start)) unsettled_.Erase(start, next - start, now);
        start = next;
    }
}

bool FlashController::IsHidden(Time now) const {
    return running_ && now - running_->start < StatusDelay(running_->bit);
}

std::uint32_t FlashController::ReadStatus(Time now) const {
    if (IsHidden(now)) {
        rules_.Record(rule::kStatusDelay, "Flash status reads idle: it doesn't show the erase yet");
    }
    return Status(now);
}

void FlashController::AdvanceTo(Time now) {
    if (!running_) return;
    const bool commit = running_->bit == kCommit;
    const Faults& faults = options_.faults;
    if (commit ? faults.commitNeverEnds : faults.eraseNeverEnds) return;
    if (now < running_->end) return;
    // A commit keeps what the register holds when it ends.
    if (commit) {
        registers_.SetResetValue(running_->address, registers_.Read(running_->address));
    } else {
        EraseEnabledBlocks(*running_, running_->end);
        inEraseMode_ = true;
        if (running_->bit == kEraseSector) sectorErased_ = running_->end;
    }
    running_.reset();
}

void FlashController::Reset() {
    // Cut off half-way. What that leaves has settled: nothing was raised to full voltage.
    if (running_ && running_->bit != kCommit) {
        const std::uint32_t half = running_->sizeBytes / 2;
        flash_.Erase(running_->address, half - half % FlashArray::kPageSizeBytes);
    }
    running_.reset();
    inEraseMode_ = false;
    sectorErased_.reset();
    addressWritten_.reset();
    blocksReady_ = Time(0);
}

std::optional<Obstacle> FlashController::PrepareToProgram(std::uint32_t address,
                                                          std::uint32_t sizeBytes, Time now) {
    if (const auto obstacle = system_.WhyFlashIsNotReady()) return obstacle;
    if (system_.IsRomAt(address, now)) {
        return Obstacle{rule::kRomAlias, "the ROM lies over it"};
    }
    // The high voltage is still of the erase's polarity.
    if (inEraseMode_) {
        return Obstacle{rule::kResetAfterErase, "no reset has followed the last erase"};
    }
    if (unsettled_.Undo(address, sizeBytes, now)) {
        rules_.Record(rule::kEraseSettling,
                      fmt::format("Erase of the flash at {:#x} undone: it was used before the "
                                  "erase had settled",
                                  address));
    }
    return std::nullopt;
}

}  // namespace target
