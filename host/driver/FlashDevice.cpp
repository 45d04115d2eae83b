// The calls into the plug-in, each followed by a look at all the ways in which it can fail.

#include "host/driver/FlashDevice.h"

#include <fmt/format.h>

#include <algorithm>
#include <charconv>

#include "host/base/Interrupt.h"
#include "host/settings/SettingKeys.h"

namespace host {

namespace {

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

FlashDevice::FlashDevice(const DeviceOptions& options, SettingStore& settings, Reporter& reporter)
    : settings_(settings),
      reporter_(reporter),
      target_(options.target),
      meter_(reporter),
      watch_(meter_),
      host_(target_.Get(), settings, reporter, watch_, ExecutableDirectory()),
      library_(options.plugin.value_or("")) {
    if (options.trace) {
        trace_.emplace(*options.trace);
        tracingHost_.emplace(host_, *trace_);
        pluginTrace_.emplace(*trace_, library_.Handle());
    }
    Create();
    Initialize();
    reporter_.Say(Talk::Verbose, fmt::format("Plug-in {}", library_.Path()));
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
    info_.family = settings_.Kept(keys::kFamily);
    info_.flashBytes = PublishedSize(settings_, keys::kFlashSize);
    info_.ramBytes = PublishedSize(settings_, keys::kRamSize);
    info_.sectorBytes = static_cast<std::uint32_t>(PublishedSize(settings_, keys::kSectorSize));
    info_.operations = operations;
    watch_.SetGeometry(info_.flashBytes, info_.sectorBytes);
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

void FlashDevice::ResetSettings(plugin::ResetMode mode) {
    const int number = static_cast<int>(mode);
    Announce(fmt::format("ResetSettings {}", number));
    Finish(device_->ResetSettings(number), "resetting the device");
}

void FlashDevice::WriteSection(const image::Section& section) {
    const std::string range = RangeText({section.address, section.Last()});
    Announce("WriteDataToFlash " + range);
    const char* error = device_->WriteDataToFlash(section.bytes.data(), section.address,
                                                  static_cast<std::uint32_t>(section.bytes.size()),
                                                  plugin::kRamPage);
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
        Finish(Host().ReadMemory(bytes.data() + done, count, address, plugin::kFlashPage, 1),
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
    if (const auto& found = watch_.FirstNotBlank())
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
    if (!watch_.FlashTouched()) return "the flash is as it was";
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

}  // namespace host
