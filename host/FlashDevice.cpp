// See FlashDevice.h.

#include "host/FlashDevice.h"

#include <fmt/format.h>

#include <algorithm>
#include <charconv>

#include "host/Interrupt.h"
#include "host/SettingKeys.h"

namespace host {

namespace {

/// The page of the target's memory that holds flash contents, and the one for everything else.
/// A section is written with the latter, because what the plug-in writes with it goes to RAM.
constexpr std::int16_t kFlashPage = 0;
constexpr std::int16_t kRamPage = 1;

constexpr std::uint32_t kReadBytes = 32 * 1024;

/// The plug-in publishes sizes as "256KB".
std::uint64_t PublishedSize(const SettingStore& settings, const char* key) {
    const std::string text = settings.Kept(key);
    std::uint64_t kilobytes = 0;
    std::from_chars(text.data(), text.data() + text.size(), kilobytes);
    return kilobytes * 1024;
}

Failure Unreachable(const std::string& doing, const char* error) {
    return {ExitStatus::Unreachable,
            fmt::format("can't reach the target: {}: {}; check the connection (of a simulated "
                        "device: the options of --sim)",
                        doing, error)};
}

}  // namespace

FlashDevice::FlashDevice(Context& context)
    : context_(context),
      target_(context.options),
      meter_(context.reporter),
      host_(target_.Get(), context.settings, context.reporter, meter_, ExecutableDirectory()),
      library_(context.options.plugin.value_or("")) {
    if (context.options.trace) {
        trace_.emplace(*context.options.trace);
        tracingHost_.emplace(host_, *trace_);
        pluginTrace_.emplace(*trace_, library_.Handle());
    }
    Create();
    Initialize();
    context_.reporter.Say(Talk::Verbose, fmt::format("Plug-in {}", library_.Path()));
}

void FlashDevice::Create() {
    IFlashDevice2* device = nullptr;
    Announce("CreateFlashDevice2");
    if (const char* error = library_.CreateDevice()("", "", "", &Host(), &device))
        throw Unreachable("identifying the device", error);
    device_.reset(device);
}

void FlashDevice::Initialize() {
    const char* operations = "";
    Announce("Initialize");
    if (const char* error = device_->Initialize(&info_.hasFlash, &operations))
        throw Unreachable("asking for the device's properties", error);
    const SettingStore& settings = context_.settings;
    info_.family = settings.Kept(keys::kFamily);
    info_.flashBytes = PublishedSize(settings, keys::kFlashSize);
    info_.ramBytes = PublishedSize(settings, keys::kRamSize);
    info_.sectorBytes = static_cast<std::uint32_t>(PublishedSize(settings, keys::kSectorSize));
    info_.operations = operations;
    meter_.SetGeometry(info_.flashBytes, info_.sectorBytes);
}

bool FlashDevice::Contains(std::uint32_t address) {
    bool within = false;
    Finish(device_->AddressWithinFlash(address, &within), "asking whether an address is flash");
    return within;
}

void FlashDevice::RequireFlash() const {
    if (info_.hasFlash) return;
    throw Failure(
        ExitStatus::DeviceFailed,
        fmt::format("the device ({}) has no flash that the plug-in can work on", info_.family));
}

AddressRange FlashDevice::RangeInFlash(const std::optional<std::string>& text) {
    RequireFlash();
    if (!text) return info_.Flash();
    const AddressRange range = ParseRange(*text);
    if (Contains(range.first) && Contains(range.last)) return range;
    throw Failure(ExitStatus::WrongUsage,
                  fmt::format("the range {} doesn't lie in the device's flash, {}",
                              RangeText(range), RangeText(info_.Flash())));
}

void FlashDevice::ResetSettings(int mode) {
    Announce(fmt::format("ResetSettings {}", mode));
    Finish(device_->ResetSettings(mode), "resetting the device");
}

void FlashDevice::WriteSection(const image::Section& section) {
    const std::string range = RangeText({section.address, section.Last()});
    Announce("WriteDataToFlash " + range);
    const char* error =
        device_->WriteDataToFlash(section.bytes.data(), section.address,
                                  static_cast<std::uint32_t>(section.bytes.size()), kRamPage);
    meter_.End();
    Finish(error, "programming " + range);
    // The plug-in leaves the loader running, which would be in the way of the next section.
    Halt();
}

void FlashDevice::Perform(const std::string& operation, Talk level) {
    host_.SetMessageLevel(level);
    Announce("PerformOperation " + operation);
    const char* error = device_->PerformOperation(operation.c_str());
    host_.SetMessageLevel(Talk::Normal);
    Finish(error, "operation " + operation);
}

std::vector<std::uint8_t> FlashDevice::ReadFlash(const AddressRange& range) {
    std::vector<std::uint8_t> bytes(range.Size());
    for (std::size_t done = 0; done < bytes.size();) {
        const std::size_t count = std::min<std::size_t>(kReadBytes, bytes.size() - done);
        const auto address = range.first + static_cast<std::uint32_t>(done);
        Finish(Host().ReadMemory(bytes.data() + done, count, address, kFlashPage, 1),
               "reading flash at " + HexText(address));
        meter_.Advance(count);
        done += count;
    }
    return bytes;
}

void FlashDevice::Halt() {
    Finish(Host().HaltTarget(), "halting the target");
}

void FlashDevice::Announce(const std::string& call) {
    if (trace_) trace_->Line("call", call);
}

void FlashDevice::Finish(const char* error, const std::string& doing) {
    const std::string text = error == nullptr ? "" : error;
    host_.CallReturned();
    if (trace_ && error != nullptr) trace_->Line("call", "failed: " + text);
    if (Interrupted()) {
        Host().HaltTarget();
        throw Failure(ExitStatus::Interrupted, "interrupted; " + StateOfFlash());
    }
    if (host_.Errors().size() > errorsSeen_) FailAsShown(text, doing);
    if (error == nullptr) return;
    throw Failure(ExitStatus::DeviceFailed,
                  fmt::format("{}: {}; {}; {}", doing, text, StateOfFlash(), Advice()));
}

void FlashDevice::FailAsShown(const std::string& text, const std::string& doing) {
    std::string error = fmt::format("{}: {}", doing, host_.Errors()[errorsSeen_]);
    if (!text.empty()) error += "; then " + text;
    errorsSeen_ = host_.Errors().size();
    if (const auto& found = meter_.FirstNotBlank())
        throw ShownFailure(
            ExitStatus::ContentsDiffer, error,
            fmt::format(
                "the flash isn't blank: {:#x} holds {:#04x}, not 0xff; erase it first (if it "
                "just was, the cell is worn out)",
                found->address, found->actual),
            {{"blank", false}, {"address", found->address}, {"actual", found->actual}});
    throw ShownFailure(
        ExitStatus::DeviceFailed, error,
        fmt::format("{} ended with {}; {}; {}", doing, text.empty() ? "the errors above" : text,
                    StateOfFlash(), Advice()));
}

std::string FlashDevice::StateOfFlash() const {
    if (!meter_.FlashTouched()) return "the flash is as it was";
    const PhaseProgress& erased = meter_.Of(Phase::Erase);
    const PhaseProgress& written = meter_.Of(Phase::Program);
    if (written.totalBytes != 0 && written.doneBytes == written.totalBytes)
        return "the image is programmed, but not compared";
    std::string text = "the flash is incomplete: " + SizeText(erased.doneBytes) + " erased";
    if (written.totalBytes != 0)
        text += fmt::format(", {} of {} handed to the loader", SizeText(written.doneBytes),
                            SizeText(written.totalBytes));
    return text + "; run the command again before the device is used";
}

std::string FlashDevice::Advice() const {
    return trace_ ? "the trace has every access" : "run it with --trace FILE to see every access";
}

Outcome WithDevice(Context& context, const std::function<Outcome(FlashDevice&)>& work) {
    FlashDevice device(context);
    Outcome outcome;
    try {
        outcome = work(device);
    } catch (const Failure&) {
        try {
            device.Save();
        } catch (const Failure& second) {
            context.reporter.Error(second.what());
        }
        throw;
    }
    if (!context.options.dryRun) device.Save();
    return outcome;
}

}  // namespace host
