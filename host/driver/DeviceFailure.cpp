// From what is known after a failure to its sentences. Nothing here touches the device.

#include "host/driver/DeviceFailure.h"

#include <fmt/format.h>

#include <algorithm>

#include "host/base/Text.h"
#include "host/output/Summary.h"

namespace host {

namespace {

/// Whether all that was to be done was done, and nothing else was begun: an erase that failed isn't
/// made good by what was programmed over it.
bool IsComplete(const KnownState& state) {
    base::AddressSet done = state.flash.erased;
    for (const base::AddressRange& range : state.flash.programmed.Ranges())
        done.Add(range);
    const PhaseProgress& erase = state.phases[Phase::Erase];
    const PhaseProgress& program = state.phases[Phase::Program];
    return done == state.flash.attempted && erase.doneBytes >= erase.totalBytes &&
           program.doneBytes >= program.totalBytes;
}

std::string FlashText(const KnownState& state) {
    const FlashWork& flash = state.flash;
    const PhaseProgress& program = state.phases[Phase::Program];
    if (flash.attempted.Empty()) return "the flash is as it was";
    if (!state.doubt.empty())
        return "what the flash holds isn't known; run the command again before the device is used";
    if (IsComplete(state))
        return program.totalBytes != 0
                   ? "the image is programmed, but not compared"
                   : SizeText(flash.erased.Bytes()) + " are erased, but not compared";
    std::string text = "the flash is incomplete: " + SizeText(flash.erased.Bytes()) + " erased";
    if (program.totalBytes != 0)
        text += fmt::format(", {} of {} written", SizeText(program.doneBytes),
                            SizeText(program.totalBytes));
    const std::uint64_t written = flash.programmed.Bytes();
    if (const std::uint64_t handedOver = flash.handedOver.Bytes(); handedOver > written)
        text += fmt::format(", {} handed to the loader and not seen to be finished",
                            SizeText(handedOver - written));
    return text + "; run the command again before the device is used";
}

/// What the device holds now: its user registers, where the run had to do with them, and its flash.
std::string StateText(const KnownState& state) {
    std::string text;
    if (state.registers.accessed) text = Describe(state.registers, state.registerValues);
    if (text.empty() || !state.flash.attempted.Empty())
        text += (text.empty() ? "" : "; ") + FlashText(state);
    return state.haltFailed ? text + "; the target couldn't be halted" : text;
}

/// What was being done and why it failed, all of it.
std::string FailureText(const FailedCall& call) {
    std::string text = call.doing + ": " + call.shown.value_or(call.error);
    while (text.ends_with('.'))
        text.pop_back();
    if (call.shown && !call.error.empty()) text += "; then " + call.error;
    if (text.find(call.cause) == std::string::npos) text += "; it began with: " + call.cause;
    return text;
}

/// The same for a user who has seen the first part.
std::string RestText(const FailedCall& call) {
    if (!call.shown) return FailureText(call);
    if (!call.cause.empty()) return call.doing + " failed: " + call.cause;
    return call.doing + " ended with the errors above" +
           (call.error.empty() ? "" : "; then " + call.error);
}

DeviceFailure NotBlankFailure(const FailedCall& call, const KnownState& state, Json members) {
    const auto [address, actual] = *state.notBlank;
    const bool erased = state.flash.erased.BytesIn({address, address}) != 0;
    std::string rest =
        erased ? "; it was erased just now, so the cell is worn out or protected" : "";
    if (!state.flash.attempted.Empty()) rest += "; " + StateText(state);
    members.update({{"blank", false}, {"address", address}, {"actual", actual}});
    return {ExitStatus::ContentsDiffer, FailureText(call) + rest,
            fmt::format("the flash isn't blank: {:#x} holds {:#04x}, not 0xff{}", address, actual,
                        rest),
            std::move(members)};
}

/// What was read since the device was there for certain shows neither a commit done nor contents.
KnownState WithoutReads(KnownState state) {
    state.notBlank.reset();
    state.registerValues = {};
    for (UserRegister& one : state.registers.registers)
        if (one.commit == Commit::Done) one.commit = Commit::Begun;
    return state;
}

/// The plug-in's own texts may tell what was read; why the device is in doubt is said in their
/// place.
DeviceFailure LostFailure(const FailedCall& call, const KnownState& state, Json members) {
    const bool touched = !state.flash.attempted.Empty() ||
                         std::ranges::any_of(state.registers.registers, [](const auto& one) {
                             return one.written.has_value();
                         });
    const std::string& why = call.cause.empty() ? call.error : call.cause;
    const bool told = state.doubt.find(why) != std::string::npos;
    const std::string text =
        fmt::format("{}: {}{}; what was read of it can't be believed; {}", call.doing, state.doubt,
                    told ? "" : "; it began with: " + why, StateText(state));
    return {touched ? ExitStatus::DeviceFailed : ExitStatus::Unreachable, text, text,
            std::move(members)};
}

DeviceFailure Judge(const FailedCall& call, const KnownState& state, Json members) {
    members.update(
        {{"flashChanged", !state.flash.attempted.Empty()}, {"phases", PhasesJson(state.phases)}});
    if (state.registers.accessed)
        members["registers"] = ToJson(state.registers, state.registerValues);
    if (state.interrupted) {
        const std::string text = "interrupted; " + StateText(state);
        return {ExitStatus::Interrupted, text, text, std::move(members)};
    }
    if (!state.doubt.empty()) return LostFailure(call, state, std::move(members));
    if (!state.identified) {
        const std::string text =
            fmt::format("can't reach the target: {}; {}", FailureText(call), state.advice);
        return {ExitStatus::Unreachable, text, text, std::move(members)};
    }
    // A blank check that follows on a failed access finds what that has left.
    if (state.notBlank && call.cause.empty())
        return NotBlankFailure(call, state, std::move(members));
    const std::string rest =
        fmt::format("; {}; {}", StateText(state),
                    state.traced ? "the trace has every access"
                                 : "run it with --trace FILE to see every access");
    return {ExitStatus::DeviceFailed, FailureText(call) + rest, RestText(call) + rest,
            std::move(members)};
}

}  // namespace

DeviceFailure MakeDeviceFailure(const FailedCall& call, const KnownState& state, Json members) {
    return Judge(call, state.doubt.empty() ? state : WithoutReads(state), std::move(members));
}

}  // namespace host
