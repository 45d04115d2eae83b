// The slots, each of which passes its work on to the target, the settings or the reporter.

#include "host/driver/FlashHost.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstring>
#include <exception>
#include <limits>
#include <string_view>
#include <utility>

#include "host/base/Interrupt.h"
#include "host/facts/Operations.h"
#include "host/facts/SettingKeys.h"
#include "host/settings/SettingCatalogue.h"

namespace host {

namespace {

std::uint32_t TargetAddress(uint64_t address) {
    if (address > std::numeric_limits<std::uint32_t>::max())
        throw target::TargetError(fmt::format("address {:#x} lies beyond 32 bits", address));
    return static_cast<std::uint32_t>(address);
}

/// The first four bytes of what is written, as the number that a register takes.
std::uint32_t Word(const void* buffer, std::size_t bytes) {
    std::uint32_t word = 0;
    if (bytes == sizeof word) std::memcpy(&word, buffer, sizeof word);
    return word;
}

}  // namespace

FlashHost::FlashHost(target::Target& target, SettingStore& settings, Reporter& reporter,
                     FlashWatch& watch, std::string directory)
    : target_(target),
      settings_(settings),
      reporter_(reporter),
      watch_(watch),
      directory_(std::move(directory)) {}

/// Runs a slot's work. No exception leaves; its text becomes the slot's answer.
template <typename Action>
const char* FlashHost::Slot(AfterInterrupt after, Action&& action) noexcept {
    if (after == AfterInterrupt::Refuse && Interrupted() && !closing_)
        return "interrupted by the user";
    try {
        action();
        return nullptr;
    } catch (const std::exception& error) {
        try {
            errorText_ = error.what();
            // What fails behind an error of the plug-in is no cause of it.
            if (firstFailure_.empty() && errors_.empty()) firstFailure_ = errorText_;
            watch_.SlotFailed();
            return errorText_.c_str();
        } catch (...) {
            return "the host ran out of memory";
        }
    }
}

// People may type a key in any case; to the plug-in another case is another key.
const char* FlashHost::GetProperty(const char* name) {
    if (std::strcmp(name, keys::kSimulatesTime) == 0) return target_.SimulatesTime() ? "1" : "0";
    bool known = false;
    const char* error = Slot(AfterInterrupt::GoOn, [&] {
        property_ = settings_.Text(name);
        const SettingInfo* info = FindSetting(name);
        known =
            (info != nullptr && std::strcmp(name, info->key) == 0) || !settings_.Kept(name).empty();
    });
    return error == nullptr && known ? property_.c_str() : nullptr;
}

const char* FlashHost::SetProperty(const char* name, const char* value) {
    return Slot(AfterInterrupt::GoOn, [&] {
        settings_.Publish(name, value);
        if (std::strcmp(name, keys::kMacInput) == 0) publishedMac_ = value;
    });
}

const char* FlashHost::LoadProgram(const char* fileName, const char*, const char* directory) {
    return Slot(AfterInterrupt::Refuse, [&] {
        target_.LoadProgram(fileName, directory);
        watch_.ProgramLoaded();
    });
}

const char* FlashHost::RunTarget() {
    return Slot(AfterInterrupt::Refuse, [&] { target_.Run(); });
}

const char* FlashHost::HaltTarget() {
    return Slot(AfterInterrupt::GoOn, [&] { target_.Halt(); });
}

const char* FlashHost::ResetTarget(bool flag) {
    return Slot(AfterInterrupt::Refuse, [&] { target_.Reset(flag); });
}

const char* FlashHost::ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                                  size_t width) {
    return Slot(AfterInterrupt::Refuse, [&] {
        const std::uint32_t where = TargetAddress(address);
        registers_.Accessing(where);
        unconfirmedReads_ = true;
        target_.Read(buffer, count, where, page, width);
        registers_.Read(where, Word(buffer, count * width));
        watch_.Read(where, count * width, static_cast<const std::uint8_t*>(buffer));
    });
}

const char* FlashHost::WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t page,
                                   size_t width) {
    return Slot(AfterInterrupt::Refuse, [&] {
        const std::uint32_t where = TargetAddress(address);
        registers_.Accessing(where);
        registers_.Writing(where, Word(buffer, count * width));
        watch_.Writing(where, Word(buffer, count * width));
        target_.Write(buffer, count, where, page, width);
    });
}

const char* FlashHost::BeginProgress(const char* title) {
    return Slot(AfterInterrupt::Refuse, [&] {
        if (displayOpen_) BreachOfProtocol("began a progress display while one was open");
        displayOpen_ = true;
        watch_.DisplayBegan(title);
    });
}

// The bytes that go by tell more than the percentage, which comes once for every 32 KiB; and over
// more than 40 MiB its 32-bit arithmetic wraps, so that it may run backwards.
const char* FlashHost::UpdateProgress(uint32_t percent, const char*) {
    return Slot(AfterInterrupt::Refuse, [&] {
        if (!displayOpen_) BreachOfProtocol("reported progress without a display");
        if (percent > 100) BreachOfProtocol(fmt::format("reported progress of {} %", percent));
    });
}

const char* FlashHost::EndProgress() {
    return Slot(AfterInterrupt::GoOn, [&] {
        if (!displayOpen_) BreachOfProtocol("ended a progress display that wasn't open");
        displayOpen_ = false;
        watch_.DisplayEnded();
    });
}

// What the tool itself says at the end is no news from the plug-in: why it stops after Ctrl-C, the
// byte that isn't blank, and that a step has failed which has said why.
const char* FlashHost::ShowError(const char* text) {
    return Slot(AfterInterrupt::GoOn, [&] {
        const bool echo = !errors_.empty() && std::string_view(text).ends_with(plugin::kStepFailed);
        errors_.emplace_back(text);
        if (watch_.FirstNotBlank() && !MayTell()) return;
        if (Interrupted())
            reporter_.PluginMessage(Verbosity::Verbose, text);
        else
            reporter_.PluginError(
                echo || watch_.FirstNotBlank() ? Verbosity::Verbose : Verbosity::Quiet, text);
    });
}

// The plug-in shows a MAC address without leading zeros, which nobody writes so.
const char* FlashHost::ShowMessage(const char* text) {
    return Slot(AfterInterrupt::GoOn, [&] {
        if (!MayTell()) return;
        std::string message = text;
        if (!publishedMac_.empty() && message.ends_with(" " + publishedMac_))
            message.replace(message.size() - publishedMac_.size(), publishedMac_.size(),
                            settings_.Published(keys::kMacInput));
        const bool told = message == plugin::kStepDone;
        reporter_.PluginMessage(told ? std::max(messageLevel_, Verbosity::Verbose) : messageLevel_,
                                message);
    });
}

const char* FlashHost::GetDirectory() {
    return directory_.c_str();
}

const char* FlashHost::Sleep(uint32_t milliseconds) {
    return Slot(AfterInterrupt::Refuse,
                [&] { target_.Pause(std::chrono::milliseconds(milliseconds)); });
}

void FlashHost::CallBegins() {
    firstFailure_.clear();
    settings_.DropPublished();
}

void FlashHost::CallReturned() {
    if (!std::exchange(displayOpen_, false)) return;
    watch_.DisplayEnded();
    BreachOfProtocol("left a progress display open");
}

void FlashHost::BreachOfProtocol(const std::string& what) {
    errors_.push_back("the plug-in " + what);
    reporter_.Error(errors_.back());
}

}  // namespace host
