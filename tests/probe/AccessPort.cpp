// CSW, TAR, DRW and the banked data registers.

#include "tests/probe/AccessPort.h"

#include "target/Target.h"

namespace probe {

namespace {

enum Register : unsigned {
    kControl = 0x00,
    kAddress = 0x04,
    kData = 0x0C,
    kBankedData = 0x10,
    kBankedDataEnd = 0x20,
    kBase = 0xF8,
    kIdentification = 0xFC
};

constexpr std::uint32_t kAhbPort = 0x24770011;
constexpr std::uint32_t kNoRomTable = 0xFFFFFFFF;

// Of the control word: the access's size, whether the address goes on by itself (packed transfers
// are an option that this port lacks), the bus's protection bits, and that the port is on.
constexpr std::uint32_t kSizeField = 0x7;
constexpr std::uint32_t kIncrement = 1U << 4;
constexpr std::uint32_t kWritable = 0x7F000000 | kIncrement | kSizeField;
constexpr std::uint32_t kEnabled = 1U << 6;

// As far as the address counts by itself on this family of cores; behind it, it starts again.
constexpr std::uint32_t kIncrementSpan = 4096;

}  // namespace

std::uint32_t AccessPort::Read(unsigned reg) {
    if (reg >= kBankedData && reg < kBankedDataEnd)
        return bus_.Read((address_ & ~0xFU) + reg - kBankedData, 4);
    switch (reg) {
        case kControl:
            return control_ | kEnabled;
        case kAddress:
            return address_;
        case kData: {
            const std::uint32_t value = bus_.Read(address_, Width()) << Lane();
            Step();
            return value;
        }
        case kBase:
            return kNoRomTable;
        case kIdentification:
            return kAhbPort;
        default:
            return 0;
    }
}

void AccessPort::Write(unsigned reg, std::uint32_t value) {
    if (reg >= kBankedData && reg < kBankedDataEnd)
        return bus_.Write((address_ & ~0xFU) + reg - kBankedData, value, 4);
    if (reg == kControl) control_ = value & kWritable;
    if (reg == kAddress) address_ = value;
    if (reg == kData) {
        bus_.Write(address_, value >> Lane() & 0xFFFFFFFF >> (32 - 8 * Width()), Width());
        Step();
    }
}

unsigned AccessPort::Width() const {
    const unsigned width = 1U << (control_ & kSizeField);
    if (width > 4 || address_ % width != 0)
        throw target::TargetError("an access that this bus has no form for");
    return width;
}

void AccessPort::Step() {
    if ((control_ & kIncrement) == 0) return;
    const std::uint32_t next = address_ + Width();
    address_ = (address_ & ~(kIncrementSpan - 1)) | (next & (kIncrementSpan - 1));
}

}  // namespace probe
