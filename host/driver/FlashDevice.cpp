// The calls into the plug-in, each followed by a look at all the ways in which it can fail.

#include "host/driver/FlashDevice.h"

#include <fmt/format.h>

#include <algorithm>
#include <charconv>
#include <utility>

#include "base/Crc32.h"
#include "base/Hex.h"
#include "base/system/Environment.h"
#include "host/base/Interrupt.h"
#include "host/facts/FlashMemory.h"
#include "host/facts/LoaderMemory.h"
#include "host/facts/SettingKeys.h"

namespace host {

namespace {

constexpr std::uint32_t kReadBytes = 32 * 1024;

/// The plug-in publishes sizes as "256KB".
std::uint64_t PublishedSize(const SettingStore& settings, const char* key) {
    const std::string text = settings.Published(key);
    std::uint64_t kilobytes = 0;
    std::from_chars(text.data(), text.data() + text.size(), kilobytes);
    return kilobytes * 1024;
}

/// What a bus reads that nothing drives.
bool IsNoIdentification(std::uint32_t word) {
    return word == 0 || word == 0xFFFFFFFF;
}

/// Everything else divides by these numbers and counts with them.
void RequireUsable(const DeviceInfo& info) {
    constexpr std::uint64_t kAddresses = std::uint64_t{1} << 32;
    const bool usable = info.sectorBytes != 0 && info.flashBytes != 0 &&
                        info.flashBytes <= kAddresses && info.sectorBytes <= info.flashBytes;
    if (usable) return;
    throw Failure(ExitStatus::DeviceFailed,
                  fmt::format("the plug-in has published a flash of {} with sectors of {}, which "
                              "can't be; name another plug-in with --plugin",
                              SizeText(info.flashBytes), SizeText(info.sectorBytes)));
}

}  // namespace

TraceLine LinesTo(Trace* trace) {
    if (trace == nullptr) return {};
    return [trace](const char* source, const std::string& text) { trace->Line(source, text); };
}

std::unique_ptr<OpenTarget> Open(const DeviceOptions& options, Reporter& reporter) {
    const auto say = [&](const std::string& text) { reporter.Say(Verbosity::Normal, text); };
    auto target = Open(options.target, LinesTo(options.trace), say);
    reporter.WorksOn(target->Description());
    return target;
}

FlashDevice::FlashDevice(const DeviceOptions& options, SettingStore& settings, Reporter& reporter)
    : FlashDevice(Open(options, reporter), options, settings, reporter) {}

FlashDevice::FlashDevice(std::unique_ptr<OpenTarget> target, const DeviceOptions& options,
                         SettingStore& settings, Reporter& reporter)
    : settings_(settings),
      reporter_(reporter),
      target_(std::move(target)),
      meter_(reporter),
      watch_(meter_),
      loader_(target_->Get(), watch_),
      host_(loader_, settings, reporter, watch_, base::ExecutableDirectory()),
      trace_(options.trace),
      library_(options.plugin.value_or("")) {
    if (target_->Get().SimulatesTime())
        meter_.SetSimulatedClock([this] { return target_->Get().Now(); });
    if (trace_) {
        tracingHost_.emplace(host_, *trace_);
        pluginTrace_.emplace(*trace_, library_.Library());
    }
    host_.SetConfirm([this] { return Confirm(); });
    Create();
    Initialize();
    identified_ = true;
    reporter_.Say(Verbosity::Verbose, fmt::format("Plug-in {}", library_.Path()));
}

void FlashDevice::Create() {
    IFlashDevice2* device = nullptr;
    Call("identifying the device", "CreateFlashDevice2",
         [&] { return library_.CreateDevice()("", "", "", &Host(), &device); });
    device_.reset(device);
    if (!device_)
        throw Failure(ExitStatus::Unreachable,
                      fmt::format("{} claims success, but has made no device object; name another "
                                  "plug-in with --plugin",
                                  library_.Path()));
    info_.identification = host_.Registers().Identification().value_or(0);
    if (IsNoIdentification(info_.identification))
        throw Failure(
            ExitStatus::Unreachable,
            fmt::format("no device answers: the identification register reads {:#010x}; {}",
                        info_.identification, target_->Advice()));
}

void FlashDevice::Initialize() {
    const char* operations = "";
    Call("asking for the device's properties", "Initialize",
         [&] { return device_->Initialize(&info_.hasFlash, &operations); });
    info_.family = settings_.Published(keys::kFamily);
    info_.flashBytes = PublishedSize(settings_, keys::kFlashSize);
    info_.ramBytes = PublishedSize(settings_, keys::kRamSize);
    info_.sectorBytes = static_cast<std::uint32_t>(PublishedSize(settings_, keys::kSectorSize));
    info_.operations = operations;
    if (info_.hasFlash) RequireUsable(info_);
    watch_.SetGeometry(info_.flashBytes, info_.sectorBytes);
    target_->RamEndsAt(plugin::kLoaderBuffers + static_cast<std::uint32_t>(info_.ramBytes));
}

bool FlashDevice::Contains(std::uint32_t address) {
    bool within = false;
    Call("asking whether an address is flash", "",
         [&] { return device_->AddressWithinFlash(address, &within); });
    return within;
}

void FlashDevice::RequireFlash() {
    if (info_.hasFlash) return;
    if (info_.family.empty())
        throw Failure(
            ExitStatus::Unreachable,
            fmt::format("the identification register reads {:#010x}, which names no class "
                        "of this family; {}",
                        info_.identification, target_->Advice()));
    throw Failure(
        ExitStatus::DeviceFailed,
        fmt::format("the device ({}) has no flash that the plug-in can work on", info_.family));
}

base::AddressRange FlashDevice::RangeInFlash(const std::string& text) {
    RequireFlash();
    const base::AddressRange range = ParseRange(text);
    if (Contains(range.first) && Contains(range.last)) return range;
    throw Failure(ExitStatus::WrongUsage,
                  fmt::format("the range {} doesn't lie in the device's flash, {}",
                              RangeText(range), RangeText(info_.Flash())));
}

void FlashDevice::RequireLoader() {
    target_->RequireLoader(base::ExecutableDirectory());
}

void FlashDevice::ResetSettings(plugin::ResetMode mode) {
    // The plug-in erases before it asks for the loader.
    if (mode == plugin::ResetMode::LoadBegins) RequireLoader();
    const int number = static_cast<int>(mode);
    Call("resetting the device", fmt::format("ResetSettings {}", number),
         [&] { return device_->ResetSettings(number); });
}

void FlashDevice::WriteSection(const image::Section& section) {
    const std::string range = RangeText({section.address, section.Last()});
    std::string unfinished;
    Call("programming " + range, "WriteDataToFlash " + range, [&] {
        const char* error = device_->WriteDataToFlash(
            section.bytes.data(), section.address, static_cast<std::uint32_t>(section.bytes.size()),
            plugin::kRamPage);
        // The plug-in doesn't look whether the loader has finished the last chunk.
        unfinished = AwaitLoader();
        meter_.End();
        if (error != nullptr) return error;
        // The plug-in leaves the loader running, which would be in the way of the next section.
        return unfinished.empty() ? Host().HaltTarget() : unfinished.c_str();
    });
}

/// What kept the loader from finishing; empty when nothing did.
std::string FlashDevice::AwaitLoader() try {
    loader_.AwaitIdle();
    return "";
} catch (const target::TargetError& error) {
    return error.what();
}

void FlashDevice::Perform(const std::string& operation, Verbosity level) {
    host_.SetMessageLevel(level);
    Call("operation " + operation, "PerformOperation " + operation, [&] {
        const char* error = device_->PerformOperation(operation.c_str());
        host_.SetMessageLevel(Verbosity::Normal);
        return error;
    });
}

std::string FlashDevice::Published(const std::string& key) const {
    std::string text = settings_.Published(key);
    if (!text.empty()) return text;
    throw Failure(ExitStatus::DeviceFailed,
                  fmt::format("the plug-in reported success, but has published no {}", key));
}

std::vector<std::uint8_t> FlashDevice::ReadFlash(const base::AddressRange& range) {
    std::vector<std::uint8_t> bytes(range.Size());
    std::string doing;
    Call(doing, "", [&] {
        const char* error = nullptr;
        for (std::size_t done = 0; done < bytes.size() && error == nullptr;) {
            const std::size_t count = std::min<std::size_t>(kReadBytes, bytes.size() - done);
            const auto address = range.first + static_cast<std::uint32_t>(done);
            doing = "reading flash at " + base::HexText(address);
            error = Host().ReadMemory(bytes.data() + done, count, address, plugin::kFlashPage, 1);
            if (error == nullptr) meter_.Advance(count);
            done += count;
        }
        return error;
    });
    return bytes;
}

std::optional<bool> FlashDevice::HoldsByChecksum(std::uint32_t address,
                                                 std::span<const std::uint8_t> bytes) {
    if (comparesBytes_ || bytes.empty()) return std::nullopt;
    std::optional<std::uint32_t> sum;
    std::string error;
    Call("summing up flash at " + base::HexText(address), "", [&]() -> const char* {
        try {
            host_.NoteRead();
            sum = loader_.Checksum(address, static_cast<std::uint32_t>(bytes.size()));
        } catch (const target::TargetError& failure) {
            error = failure.what();
        }
        return error.empty() ? nullptr : error.c_str();
    });
    if (!sum) return std::nullopt;
    const std::string_view text(reinterpret_cast<const char*>(bytes.data()), bytes.size());
    const bool holds = *sum == base::AddToCrc32(base::kCrc32Begin, text);
    if (holds) meter_.Advance(bytes.size());
    return holds;
}

std::uint32_t FlashDevice::ReadUserRegister(unsigned index) {
    std::uint32_t value = 0;
    Call(fmt::format("reading user register {}", index), "", [&] {
        return Host().ReadMemory(&value, 1, plugin::kUserRegisters.at(index), plugin::kRamPage,
                                 sizeof value);
    });
    return value;
}

void FlashDevice::Halt() {
    Call("halting the target", "", [&] { return Host().HaltTarget(); });
}

void FlashDevice::Reset() {
    Call("resetting the device", "", [&] { return Host().ResetTarget(true); });
}

void FlashDevice::StartProgram() {
    Reset();
    ResetSettings(plugin::ResetMode::TargetWillRun);
    runsAtEnd_ = true;
}

void FlashDevice::Close(DeviceFile file) {
    if (file == DeviceFile::Save) target_->Keep(watch_.ContentsTouched());
    try {
        target_->Release(runsAtEnd_);
    } catch (const target::TargetError& error) {
        throw Failure(ExitStatus::DeviceFailed, error.what());
    }
}

/// One call: what came of it is looked for in all the places where a failure can show.
template <typename Action>
void FlashDevice::Call(const std::string& doing, const std::string& traced, Action&& action) {
    if (trace_ && !traced.empty()) trace_->Line("call", traced);
    host_.CallBegins();
    const char* error = action();
    host_.CallReturned();
    if (trace_ && error != nullptr) trace_->Line("call", fmt::format("failed: {}", error));
    if (Interrupted() || !host_.Errors().empty() || error != nullptr)
        Fail(doing, error == nullptr ? "" : error);
    if (!Confirm()) Fail(doing, doubt_);
}

/// Whether the device is still there, if anything was read since that was known.
bool FlashDevice::Confirm() {
    if (Interrupted() && !closing_) return false;
    if (doubt_.empty() && info_.identification != 0 && host_.HasUnconfirmedReads())
        doubt_ = Doubt();
    return doubt_.empty();
}

/// Why what was read can't be believed; empty when it can.
std::string FlashDevice::Doubt() try {
    std::uint32_t now = 0;
    // Not by the slot: this is no part of the plug-in's work, and no step of a phase.
    loader_.Read(&now, 1, plugin::kIdentificationRegister, plugin::kRamPage, sizeof now);
    if (trace_) trace_->Line("confirm", "identification register: " + base::HexText(now));
    if (now != info_.identification)
        return fmt::format(
            "the device is gone: its identification register reads {:#010x}, not {:#010x} as "
            "before",
            now, info_.identification);
    host_.ReadsConfirmed();
    confirmed_ = meter_.Phases();
    return "";
} catch (const target::TargetError& error) {
    if (trace_) trace_->Line("confirm", fmt::format("failed: {}", error.what()));
    // After a failure that was told, what was answered before it is true.
    const bool told = closing_ && !loader_.HidesFailedReads();
    return told ? "" : fmt::format("the device doesn't answer any more: {}", error.what());
}

void FlashDevice::LeaveHalted() {
    if (std::exchange(closing_, true)) return;
    host_.BeginClosing();
    haltFailed_ = Host().HaltTarget() != nullptr;
}

RegisterValues FlashDevice::TryUserRegisters() {
    RegisterValues values;
    for (unsigned index = 0; index < values.size(); ++index) {
        std::uint32_t value = 0;
        if (Host().ReadMemory(&value, 1, plugin::kUserRegisters[index], plugin::kRamPage,
                              sizeof value) == nullptr)
            values[index] = value;
    }
    return values;
}

void FlashDevice::Fail(const std::string& doing, const std::string& error) {
    FailedCall call{doing, error};
    if (!host_.Errors().empty()) call.shown = host_.Errors().front();
    call.cause = host_.FirstFailure();
    // The plug-in blames an option then.
    const std::string commit = UnendedCommit(UserRegisters());
    if (doubt_.empty() && call.cause.empty() && !commit.empty()) call = {doing, commit};
    LeaveHalted();
    throw MakeDeviceFailure(call, StateAfterFailure(), failureMembers_);
}

KnownState FlashDevice::StateAfterFailure() {
    RegisterValues values;
    if (UserRegisters().accessed) values = TryUserRegisters();
    const bool believed = Confirm();
    return {.flash = watch_.Work(),
            .phases = believed ? meter_.Phases() : confirmed_,
            .notBlank = watch_.FirstNotBlank(),
            .registers = UserRegisters(),
            .registerValues = values,
            .identified = identified_,
            .advice = identified_ || !believed ? "" : target_->Advice(),
            .doubt = doubt_,
            .interrupted = Interrupted(),
            .haltFailed = haltFailed_,
            .traced = trace_ != nullptr};
}

}  // namespace host
