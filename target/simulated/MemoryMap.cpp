// Address decoding: every transfer is checked as a whole, then reaches flash, RAM or registers.

#include "target/simulated/MemoryMap.h"

#include <fmt/format.h>

#include <algorithm>

#include "base/ByteOrder.h"
#include "target/simulated/Rules.h"

namespace target {

namespace {

constexpr std::uint64_t kAddressSpaceBytes = 0x100000000;

constexpr std::uint32_t kRegisterSizeBytes = 4;

// A transfer is decided on as a whole before anything is moved: its form, then the region that it
// starts in, which it must not leave. So flash and RAM are transferred completely or not at all.
// The registers have no region of their own; each is found, or refused, by itself.

// What can be told from the transfer alone.
void CheckForm(const Transfer& transfer) {
    const std::size_t width = transfer.width;
    if (transfer.page != kFlashPage && transfer.page != kGeneralPage) {
        Refuse(rule::kPage, "the device has the pages 0 (flash) and 1 (everything)");
    }
    if (width != 1 && width != 2 && width != 4) {
        Refuse(rule::kAccessWidth, "elements are 1, 2 or 4 bytes wide");
    }
    if (transfer.address % width != 0) {
        Refuse(rule::kAlignedAccess, fmt::format("the address is no multiple of {}", width));
    }
    if (transfer.count != 0 && transfer.SizeBytes() == 0) {
        Refuse(rule::kMappedAddress, "the range runs past the end of the address space");
    }
}

}  // namespace

std::uint64_t Transfer::SizeBytes() const {
    const std::uint64_t room = kAddressSpaceBytes - address;
    return width == 0 || count > room / width ? 0 : std::uint64_t{count} * width;
}

MemoryMap::MemoryMap(const DeviceOptions& options, FlashArray& flash, Ram& ram,
                     RegisterFile& registers, SystemControl& system, FlashController& controller,
                     Loader& loader)
    : registerFault_(options.faults.registers),
      flash_(flash),
      ram_(ram),
      registers_(registers),
      system_(system),
      controller_(controller),
      loader_(loader) {}

MemoryMap::Region MemoryMap::CheckedRegion(const Transfer& transfer) const {
    CheckForm(transfer);
    const std::uint32_t address = transfer.address;
    // A transfer of nothing still has to point somewhere.
    const std::uint64_t size = std::max<std::uint64_t>(transfer.SizeBytes(), 1);
    if (flash_.Contains(address, size)) return Region::Flash;
    const bool inRam = ram_.Contains(address, 1);
    if (flash_.Contains(address, 1) || (inRam && !ram_.Contains(address, size))) {
        Refuse(rule::kMappedAddress, "the range runs past the end of the memory it starts in");
    }
    if (transfer.page != kGeneralPage) {
        Refuse(rule::kPage, fmt::format("page 0 holds nothing but the 0x{:X} bytes of flash",
                                        flash_.SizeBytes()));
    }
    if (inRam) return Region::Ram;
    if (transfer.width != kRegisterSizeBytes) {
        Refuse(rule::kAccessWidth,
               "there is no memory here, and registers are accessed as 32-bit words only");
    }
    return Region::Registers;
}

void MemoryMap::Read(const Transfer& transfer, std::uint8_t* bytes, Time now) const {
    const std::uint32_t address = transfer.address;
    const std::size_t size = transfer.SizeBytes();
    switch (CheckedRegion(transfer)) {
        case Region::Flash:
            // One array: while some cell is under high voltage none can be read.
            if (controller_.IsBusy() || loader_.IsProgramming()) {
                Refuse(rule::kFlashBusy, "the flash is being erased or programmed");
            }
            return ReadFlash(address, {bytes, size}, now);
        case Region::Ram: {
            const auto held = ram_.Bytes(address, size);
            std::copy(held.begin(), held.end(), bytes);
            return;
        }
        case Region::Registers:
            for (std::uint32_t offset = 0; offset < size; offset += kRegisterSizeBytes) {
                base::StoreWord(bytes + offset, ReadRegister(address + offset, now));
            }
            return;
    }
}

// The ROM, where it lies over the flash, is no error: whoever reads there gets what is there.
void MemoryMap::ReadFlash(std::uint32_t address, std::span<std::uint8_t> bytes, Time now) const {
    flash_.Read(address, bytes);
    if (!system_.IsRomAt(address, now)) return;
    const std::size_t covered = SystemControl::kRomSizeBytes - address;
    std::fill_n(bytes.begin(), std::min(covered, bytes.size()), SystemControl::kRomByte);
}

void MemoryMap::Write(const Transfer& transfer, const std::uint8_t* bytes, CoreState core,
                      Time now) {
    const std::uint32_t address = transfer.address;
    const std::size_t size = transfer.SizeBytes();
    switch (CheckedRegion(transfer)) {
        case Region::Flash:
            Refuse(rule::kFlashReadOnly, "flash can't be written like memory; use the loader");
        case Region::Ram:
            // From the hand-over on, buffer and parameters are the loader's until it says
            // otherwise.
            if (loader_.Owns(address, size)) {
                Refuse(rule::kBufferInUse,
                       "the loader hasn't finished the chunk that was handed over in this buffer");
            }
            std::copy_n(bytes, size, ram_.Bytes(address, size).begin());
            return;
        case Region::Registers:
            for (std::uint32_t offset = 0; offset < size; offset += kRegisterSizeBytes) {
                WriteRegister(address + offset, base::LoadWord(bytes + offset), core, now);
            }
            return;
    }
}

std::uint32_t MemoryMap::PeekRegister(std::uint32_t address, Time now) const {
    switch (registerFault_) {
        case RegisterFault::Ones:
            return 0xFFFFFFFF;
        case RegisterFault::Zeros:
            return 0;
        case RegisterFault::None:
            break;
    }
    return address == reg::kFlashCommand ? controller_.Status(now) : registers_.Read(address);
}

std::uint32_t MemoryMap::ReadRegister(std::uint32_t address, Time now) const {
    if (address == reg::kFlashCommand && registerFault_ == RegisterFault::None) {
        return controller_.ReadStatus(now);
    }
    return PeekRegister(address, now);
}

void MemoryMap::WriteRegister(std::uint32_t address, std::uint32_t value, CoreState core,
                              Time now) {
    // A register bus that reads constants doesn't bring a write through either.
    if (registerFault_ != RegisterFault::None) return;
    // Two masters at one controller would take each other's address.
    if (!FlashController::Owns(address)) return system_.Write(address, value, core, now);
    if (loader_.IsProgramming()) {
        Refuse(rule::kFlashBusy, "the loader is using the flash controller");
    }
    controller_.Write(address, value, core, now);
}

}  // namespace target
