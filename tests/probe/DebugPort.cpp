// CTRL/STAT, SELECT and RDBUFF, and the way to the access port.

#include "tests/probe/DebugPort.h"

#include "target/Target.h"

namespace probe {

namespace {

constexpr unsigned kControlStatus = 0x4;
constexpr unsigned kSelect = 0x8;

constexpr std::uint32_t kStickyError = 1U << 5;
constexpr std::uint32_t kPowerRequests = 1U << 28 | 1U << 30;  // the core's, the system's

}  // namespace

void DebugPort::AccessItself(bool reads, unsigned reg, std::uint32_t data) {
    if (reads)
        result_ = reg == kControlStatus ? Status() : reg == kSelect ? select_ : 0;
    else if (reg == kControlStatus)
        SetStatus(data);
    else if (reg == kSelect)
        select_ = data;
}

void DebugPort::AccessPortBehind(bool reads, unsigned reg, std::uint32_t data) try {
    if (failed_) return;
    if (power_ != kPowerRequests) throw target::TargetError("the debug port has no power");
    const bool isThere = select_ >> 24 == 0;
    const unsigned offset = (select_ & 0xF0) | reg;
    if (reads)
        result_ = isThere ? port_.Read(offset) : 0;
    else if (isThere)
        port_.Write(offset, data);
} catch (const target::TargetError&) {
    failed_ = true;
}

// Each request for power is granted in the bit above it.
std::uint32_t DebugPort::Status() const {
    return power_ | power_ << 1 | (failed_ ? kStickyError : 0);
}

void DebugPort::SetStatus(std::uint32_t value) {
    power_ = value & kPowerRequests;
    if ((value & kStickyError) != 0) failed_ = false;
}

}  // namespace probe
