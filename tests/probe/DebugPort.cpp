// The states of IEEE 1149.1, the registers behind the instructions, and the way to the access port.

#include "tests/probe/DebugPort.h"

#include "target/Target.h"

namespace probe {

namespace {

constexpr std::uint32_t kIdentificationCode = 0x4BA00477;
constexpr unsigned kInstructionBits = 4;
constexpr unsigned kAccessBits = 35;  // what to do or what came of it in three, and data
constexpr std::uint32_t kDone = 2;    // what came of it; nothing here is ever late

enum Instruction : std::uint32_t {
    kAbort = 0x8,
    kDebugAccess = 0xA,
    kPortAccess = 0xB,
    kIdentification = 0xE
};

constexpr unsigned kControlStatus = 0x4;
constexpr unsigned kSelect = 0x8;

constexpr std::uint32_t kStickyError = 1U << 5;
constexpr std::uint32_t kPowerRequests = 1U << 28 | 1U << 30;  // the core's, the system's

}  // namespace

// By the level of TMS at the edge. From Select a high one goes on to the other scan.
const DebugPort::State DebugPort::kNext[][2] = {
    {State::RunTestIdle, State::TestLogicReset},  // of TestLogicReset
    {State::RunTestIdle, State::Select},          // RunTestIdle
    {State::Capture, State::Select},              // Select
    {State::Shift, State::Exit1},                 // Capture
    {State::Shift, State::Exit1},                 // Shift
    {State::Pause, State::Update},                // Exit1
    {State::Pause, State::Exit2},                 // Pause
    {State::Shift, State::Update},                // Exit2
    {State::RunTestIdle, State::Select},          // Update
};

// An edge does the work of the state that it leaves; updates come with the state that it enters.
void DebugPort::Clock(bool tms, bool tdi) {
    if (state_ == State::Capture) Capture();
    if (state_ == State::Shift) shift_ = shift_ >> 1 | std::uint64_t{tdi} << (lengthBits_ - 1);
    const State left = state_;
    state_ = kNext[static_cast<int>(left)][tms];
    if (state_ == State::Select) {
        if (left == State::Select && scansInstruction_) state_ = State::TestLogicReset;
        scansInstruction_ = left == State::Select;
    }
    if (state_ == State::TestLogicReset) instruction_ = kIdentification;
    if (state_ == State::Update) Update();
}

bool DebugPort::Tdo() const {
    return state_ != State::Shift || (shift_ & 1) != 0;
}

void DebugPort::Capture() {
    if (scansInstruction_) return Load(1, kInstructionBits);
    if (instruction_ == kIdentification) return Load(kIdentificationCode, 32);
    if (instruction_ == kAbort || instruction_ == kDebugAccess || instruction_ == kPortAccess)
        return Load(std::uint64_t{result_} << 3 | kDone, kAccessBits);
    Load(0, 1);
}

void DebugPort::Update() {
    if (scansInstruction_) {
        instruction_ = static_cast<std::uint32_t>(shift_);
        return;
    }
    const bool reads = (shift_ & 1) != 0;
    const auto reg = static_cast<unsigned>(shift_ & 6) << 1;
    const auto data = static_cast<std::uint32_t>(shift_ >> 3);
    if (instruction_ == kDebugAccess) AccessItself(reads, reg, data);
    if (instruction_ == kPortAccess) AccessPortBehind(reads, reg, data);
}

void DebugPort::Load(std::uint64_t value, unsigned lengthBits) {
    shift_ = value;
    lengthBits_ = lengthBits;
}

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
