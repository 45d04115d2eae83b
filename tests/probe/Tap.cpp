// The states of IEEE 1149.1 and the registers behind the instructions.

#include "tests/probe/Tap.h"

namespace probe {

namespace {

constexpr unsigned kInstructionBits = 4;
constexpr unsigned kAccessBits = 35;  // what to do or what came of it in three, and data

enum Instruction : std::uint32_t {
    kAbort = 0x8,
    kDebugAccess = 0xA,
    kPortAccess = 0xB,
    kIdentification = 0xE,
    kBypass = 0xF
};

}  // namespace

// By the level of TMS at the edge.
const Tap::State Tap::kNext[][2] = {
    {State::RunTestIdle, State::TestLogicReset},  // of TestLogicReset
    {State::RunTestIdle, State::SelectDr},        // RunTestIdle
    {State::CaptureDr, State::SelectIr},          // SelectDr
    {State::ShiftDr, State::Exit1Dr},             // CaptureDr
    {State::ShiftDr, State::Exit1Dr},             // ShiftDr
    {State::PauseDr, State::UpdateDr},            // Exit1Dr
    {State::PauseDr, State::Exit2Dr},             // PauseDr
    {State::ShiftDr, State::UpdateDr},            // Exit2Dr
    {State::RunTestIdle, State::SelectDr},        // UpdateDr
    {State::CaptureIr, State::TestLogicReset},    // SelectIr
    {State::ShiftIr, State::Exit1Ir},             // CaptureIr
    {State::ShiftIr, State::Exit1Ir},             // ShiftIr
    {State::PauseIr, State::UpdateIr},            // Exit1Ir
    {State::PauseIr, State::Exit2Ir},             // PauseIr
    {State::ShiftIr, State::UpdateIr},            // Exit2Ir
    {State::RunTestIdle, State::SelectDr},        // UpdateIr
};

// An edge does the work of the state that it leaves; updates come with the state that it enters.
void Tap::Clock(bool tms, bool tdi) {
    if (state_ == State::CaptureDr || state_ == State::CaptureIr) Capture();
    if (state_ == State::ShiftDr || state_ == State::ShiftIr)
        shift_ = shift_ >> 1 | std::uint64_t{tdi} << (lengthBits_ - 1);
    state_ = kNext[static_cast<int>(state_)][tms];
    if (state_ == State::TestLogicReset) instruction_ = kIdentification;
    if (state_ == State::UpdateDr || state_ == State::UpdateIr) Update();
}

bool Tap::Tdo() const {
    return (state_ != State::ShiftDr && state_ != State::ShiftIr) || (shift_ & 1) != 0;
}

void Tap::Capture() {
    if (state_ == State::CaptureIr) return Load(1, kInstructionBits);
    switch (instruction_) {
        case kIdentification:
            return Load(DebugPort::kIdentification, 32);
        case kAbort:
        case kDebugAccess:
        case kPortAccess:
            return Load(std::uint64_t{port_.Result()} << 3 | DebugPort::kDone, kAccessBits);
        default:
            return Load(0, 1);
    }
}

void Tap::Update() {
    if (state_ == State::UpdateIr) {
        instruction_ = static_cast<std::uint32_t>(shift_);
        return;
    }
    const bool reads = (shift_ & 1) != 0;
    const auto reg = static_cast<unsigned>(shift_ & 6) << 1;
    const auto data = static_cast<std::uint32_t>(shift_ >> 3);
    if (instruction_ == kDebugAccess) port_.AccessItself(reads, reg, data);
    if (instruction_ == kPortAccess) port_.AccessPortBehind(reads, reg, data);
}

void Tap::Load(std::uint64_t value, unsigned lengthBits) {
    shift_ = value;
    lengthBits_ = lengthBits;
}

}  // namespace probe
