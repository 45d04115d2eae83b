// The system control space, and what its debug part does to the core.

#include "tests/probe/Core.h"

#include <algorithm>
#include <string>

#include "target/Target.h"
#include "target/simulated/Ram.h"

namespace probe {

namespace {

using target::gdb::CoreRegisters;

enum Address : std::uint32_t {
    kOwnStart = 0xE0000000,  // of the addresses that the core answers itself
    kFpCtrl = 0xE0002000,
    kCpuid = 0xE000ED00,
    kAircr = 0xE000ED0C,
    kDfsr = 0xE000ED30,
    kDhcsr = 0xE000EDF0,
    kDcrsr = 0xE000EDF4,
    kDcrdr = 0xE000EDF8,
    kDemcr = 0xE000EDFC
};

constexpr std::uint32_t kCortexM3 = 0x412FC231;

// FP_CTRL
constexpr std::uint32_t kFpEnable = 1U << 0;
constexpr std::uint32_t kFpKey = 1U << 1;

// DHCSR
constexpr std::uint32_t kDebugKey = 0xA05F;
constexpr std::uint32_t kDebugEnable = 1U << 0;
constexpr std::uint32_t kHalt = 1U << 1;
constexpr std::uint32_t kStep = 1U << 2;
constexpr std::uint32_t kControlBits = 0xF;
constexpr std::uint32_t kRegisterReady = 1U << 16;
constexpr std::uint32_t kHalted = 1U << 17;
constexpr std::uint32_t kLockedUp = 1U << 19;
constexpr std::uint32_t kWasReset = 1U << 25;

// DFSR
constexpr std::uint32_t kByRequest = 1U << 0;
constexpr std::uint32_t kByVectorCatch = 1U << 3;

// DEMCR
constexpr std::uint32_t kCatchReset = 1U << 0;
constexpr std::uint32_t kCatchHardFault = 1U << 10;

// AIRCR
constexpr std::uint32_t kResetKey = 0x05FA;
constexpr std::uint32_t kResetRequest = 1U << 2;
constexpr std::uint32_t kAircrReads = 0xFA050000;

// DCRSR
constexpr std::uint32_t kRegisterWrites = 1U << 16;
constexpr unsigned kMainStack = 17;
constexpr unsigned kProcessStack = 18;
constexpr unsigned kSpecials = 20;

// xPSR
constexpr std::uint32_t kThumb = 1U << 24;
constexpr std::uint32_t kHardFault = 3;

constexpr std::uint32_t kResetVector = 4;
constexpr std::uint32_t kHardFaultVector = 12;
constexpr std::uint32_t kLockupAddress = 0xFFFFFFFE;

}  // namespace

Core::Core(target::ServedSimulation& device, const CoreFaults& faults)
    : device_(device), faults_(faults) {
    device_.Reset();
    LeaveReset();
}

std::uint32_t Core::Read(std::uint32_t address, unsigned width) {
    CatchUp();
    if (address >= kOwnStart) {
        if (width != 4) throw target::TargetError("these registers are words");
        return ReadRegister(address);
    }
    const std::string bytes = device_.Read(address, width, width);
    std::uint32_t value = 0;
    for (unsigned i = width; i-- > 0;)
        value = value << 8 | static_cast<unsigned char>(bytes[i]);
    return value;
}

void Core::Write(std::uint32_t address, std::uint32_t value, unsigned width) {
    CatchUp();
    if (address >= kOwnStart) {
        if (width != 4) throw target::TargetError("these registers are words");
        return WriteRegister(address, value);
    }
    std::string bytes;
    for (unsigned i = 0; i < width; ++i)
        bytes += static_cast<char>(value >> (8 * i));
    device_.Write(address, bytes, width);
}

const char* Core::StateText() {
    CatchUp();
    static constexpr const char* kTexts[] = {"in reset", "halted", "running", "locked up"};
    return kTexts[static_cast<int>(state_)];
}

// The breakpoint unit can be switched on, and has no comparators. What isn't here reads as zero.
std::uint32_t Core::ReadRegister(std::uint32_t address) {
    switch (address) {
        case kFpCtrl:
            return breakpoints_;
        case kCpuid:
            return kCortexM3;
        case kAircr:
            return kAircrReads;
        case kDfsr:
            return haltReasons_;
        case kDhcsr:
            return HaltingStatus();
        case kDcrdr:
            return transferData_;
        case kDemcr:
            return catches_;
        default:
            return 0;
    }
}

void Core::WriteRegister(std::uint32_t address, std::uint32_t value) {
    switch (address) {
        case kFpCtrl:
            if ((value & kFpKey) != 0) breakpoints_ = value & kFpEnable;
            return;
        case kAircr:
            if (value >> 16 == kResetKey && (value & kResetRequest) != 0) Reset();
            return;
        case kDfsr:
            haltReasons_ &= ~value;
            return;
        case kDhcsr:
            if (value >> 16 == kDebugKey) Control(value & kControlBits);
            return;
        case kDcrsr:
            return Transfer(value);
        case kDcrdr:
            transferData_ = value;
            return;
        case kDemcr:
            catches_ = value;
            return;
        default:
            return;
    }
}

std::uint32_t Core::HaltingStatus() {
    const std::uint32_t status =
        control_ | kRegisterReady | (state_ == State::Halted ? kHalted : 0) |
        (state_ == State::LockedUp ? kLockedUp : 0) | (resetSeen_ ? kWasReset : 0);
    resetSeen_ = state_ == State::InReset;
    return status;
}

void Core::Control(std::uint32_t value) {
    control_ = (value & kDebugEnable) != 0 ? value : 0;
    if (state_ == State::InReset) return;
    if ((control_ & kHalt) != 0) return Halt(kByRequest);
    if (state_ != State::Halted) return;
    Start();
    if ((control_ & kStep) != 0) Halt(kByRequest);
}

void Core::Transfer(std::uint32_t selection) {
    std::uint32_t* const reg = CoreRegister(selection & 0x7F);
    if (state_ != State::Halted) return;
    if ((selection & kRegisterWrites) == 0)
        transferData_ = reg != nullptr ? *reg : 0;
    else if (reg != nullptr)
        *reg = transferData_;
    Pc() &= ~std::uint32_t{1};
}

std::uint32_t* Core::CoreRegister(unsigned number) {
    if (number < CoreRegisters::kCount) return &device_.Registers().values[number];
    if (number == kMainStack) return &device_.Registers().values[CoreRegisters::kSp];
    if (number == kProcessStack) return &processStack_;
    return number == kSpecials ? &specials_ : nullptr;
}

/// What was due in the meantime happens now.
void Core::CatchUp() {
    if (std::chrono::steady_clock::now() < due_) return;
    if (state_ == State::InReset) return LeaveReset();
    if (state_ == State::Running && std::exchange(crashDue_, false)) FailHard();
}

void Core::Reset() {
    device_.Reset();
    state_ = State::InReset;
    resetSeen_ = true;
    crashDue_ = false;
    control_ &= kDebugEnable;
    due_ = std::chrono::steady_clock::now() + faults_.resetTime;
    CatchUp();
}

// The vectors have been read; bit 0 of the program counter is the state of the core.
void Core::LeaveReset() {
    state_ = State::Halted;
    const std::uint32_t vector = Read(kResetVector, 4);
    Status() = (vector & 1) != 0 ? kThumb : 0;
    if (Debugged() && (catches_ & kCatchReset) != 0 && !faults_.neverHalts)
        haltReasons_ |= kByVectorCatch;
    else
        Start();
    if ((control_ & kHalt) != 0) Halt(kByRequest);
}

void Core::Start() {
    const bool inRam = Pc() >= target::Ram::kStart;
    if ((Status() & kThumb) == 0 || !IsCode(Pc())) return FailHard();
    state_ = State::Running;
    device_.Start();
    crashDue_ = inRam && faults_.crashesAfter;
    if (crashDue_) due_ = std::chrono::steady_clock::now() + *faults_.crashesAfter;
}

/// There is no way on: into the handler, and if that isn't code either, into lockup.
void Core::FailHard() {
    device_.Stop();
    const std::uint32_t handler = Read(kHardFaultVector, 4);
    Pc() = handler & ~std::uint32_t{1};
    Status() = ((handler & 1) != 0 ? kThumb : 0) | kHardFault;
    state_ = State::Running;
    if (Debugged() && (catches_ & kCatchHardFault) != 0) return Halt(kByVectorCatch);
    if ((handler & 1) != 0 && IsCode(Pc())) return;  // where the loader isn't
    Pc() = kLockupAddress;
    state_ = State::LockedUp;
}

void Core::Halt(std::uint32_t reason) {
    if (state_ == State::Halted || faults_.neverHalts) return;
    device_.Stop();
    state_ = State::Halted;
    haltReasons_ |= reason;
}

bool Core::Debugged() const {
    return (control_ & kDebugEnable) != 0;
}

bool Core::IsCode(std::uint32_t address) const {
    const auto regions = device_.Regions();
    return std::any_of(regions.begin(), regions.begin() + 2, [&](const auto& region) {
        return address - region.address < region.sizeBytes;
    });
}

std::uint32_t& Core::Pc() {
    return device_.Registers().values[CoreRegisters::kPc];
}

std::uint32_t& Core::Status() {
    return device_.Registers().values[CoreRegisters::kStatus];
}

}  // namespace probe
