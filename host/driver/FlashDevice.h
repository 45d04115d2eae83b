// A device that is ready to be worked on: the target, the loaded plug-in and the device object that
// it made. Every call into the plug-in goes through here, so that a failure of any kind (an error
// text, an error that was only shown, Ctrl-C) ends a command in the same way.
//
// A probe's server may make zeros of reads that fail. So nothing that was read is told before the
// identification register was read once more, and has answered as it did at first: at the end of
// each call that has read anything, and before a message of the plug-in is shown. Once it doesn't,
// the run fails, and nothing that was read since the last time counts.

#pragma once

#include <chrono>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "host/base/Text.h"
#include "host/driver/DeviceFailure.h"
#include "host/driver/DeviceInfo.h"
#include "host/driver/FlashHost.h"
#include "host/driver/FlashReader.h"
#include "host/driver/FlashWatch.h"
#include "host/driver/PluginLibrary.h"
#include "host/driver/Trace.h"
#include "host/driver/TracingHost.h"
#include "host/facts/Operations.h"
#include "host/image/Image.h"
#include "host/output/WorkMeter.h"
#include "host/targets/LoaderWait.h"
#include "host/targets/OpenTarget.h"

namespace host {

/// Which target, through which plug-in, and what traces it: null, or a trace that outlives the
/// device.
struct DeviceOptions {
    TargetOptions target;
    std::optional<std::string> plugin;
    Trace* trace = nullptr;
};

/// What a target tells the trace; empty without one.
TraceLine LinesTo(Trace* trace);

/// What becomes of the file of a simulated device, where one was named.
enum class DeviceFile { Save, LeaveAlone };

/// The target that the options name, told as the one that is worked on. Failure (WrongUsage) or
/// Failure (Unreachable).
std::unique_ptr<OpenTarget> Open(const DeviceOptions& options, Reporter& reporter);

class FlashDevice final : public FlashReader {
  public:
    /// Failure (Unreachable) when plug-in or target can't be had.
    FlashDevice(const DeviceOptions& options, SettingStore& settings, Reporter& reporter);

    /// The same on a target that is open already; what `options` say of one doesn't count.
    FlashDevice(std::unique_ptr<OpenTarget> target, const DeviceOptions& options,
                SettingStore& settings, Reporter& reporter);

    const DeviceInfo& Info() const { return info_; }
    std::string LibraryPath() const { return library_.Path(); }
    SettingStore& Settings() { return settings_; }
    Reporter& Output() { return reporter_; }
    WorkMeter& Meter() { return meter_; }
    const FlashWork& Work() const { return watch_.Work(); }
    const UserRegisterWork& UserRegisters() const { return host_.Registers().UserRegisters(); }

    /// By the plug-in's own answer.
    bool Contains(std::uint32_t address) override;

    /// A range as the command line has it. Failure (WrongUsage) when it doesn't lie in flash,
    /// Failure (DeviceFailed) when there is no flash.
    base::AddressRange RangeInFlash(const std::string& text);

    /// Failure (DeviceFailed) for a device whose flash the plug-in can't work on.
    void RequireFlash();

    /// Failure (BadFile) when the target needs a loader of its own and hasn't got it.
    void RequireLoader();

    void ResetSettings(plugin::ResetMode mode);

    /// Hands a section to the plug-in and waits until the loader is done with it; then the target
    /// is halted.
    void WriteSection(const image::Section& section);

    /// How long the loader may take for the last chunk of a section.
    void LimitLastChunk(std::chrono::milliseconds limit) { loader_.SetLimit(limit); }

    /// Runs a named operation, its messages shown at `level`.
    void Perform(const std::string& operation, Verbosity level = Verbosity::Normal);

    /// What the last call has published. Failure (DeviceFailed) when it is nothing.
    std::string Published(const std::string& key) const;

    /// Adds to what the JSON lines of a failure have: the command's plan, for one.
    void AddToFailures(const Json& members) { failureMembers_.update(members); }

    /// Reads flash of the halted target, counting the bytes for the running phase.
    std::vector<std::uint8_t> ReadFlash(const base::AddressRange& range) override;
    std::optional<bool> HoldsByChecksum(std::uint32_t address,
                                        std::span<const std::uint8_t> bytes) override;

    /// From now on nothing is compared by its checksum.
    void CompareBytes() { comparesBytes_ = true; }

    std::uint32_t ReadUserRegister(unsigned index);
    void Halt() override;

    /// Ends the work after a failure of any kind, Ctrl-C included.
    void LeaveHalted();

    void Reset();

    /// Resets the device and prepares it to run its own program, which begins when the device is
    /// closed.
    void StartProgram();

    /// The last thing done with a device: a simulated one's contents are kept, where a file was
    /// named for them, and the target is left halted or starts its program. Failure.
    void Close(DeviceFile file);

  private:
    struct Destroyer {
        void operator()(IFlashDevice2* device) const { device->Destroy(); }
    };

    IFlashHost& Host() { return tracingHost_ ? static_cast<IFlashHost&>(*tracingHost_) : host_; }
    void Create();
    void Initialize();
    template <typename Action>
    void Call(const std::string& doing, const std::string& traced, Action&& action);
    [[noreturn]] void Fail(const std::string& doing, const std::string& error);
    KnownState StateAfterFailure();
    bool Confirm();
    std::string Doubt();
    RegisterValues TryUserRegisters();
    std::string AwaitLoader();

    SettingStore& settings_;
    Reporter& reporter_;
    std::unique_ptr<OpenTarget> target_;
    WorkMeter meter_;
    FlashWatch watch_;
    LoaderWait loader_;
    FlashHost host_;
    Trace* trace_;
    std::optional<TracingHost> tracingHost_;
    PluginLibrary library_;
    std::optional<PluginTrace> pluginTrace_;
    std::unique_ptr<IFlashDevice2, Destroyer> device_;
    DeviceInfo info_;
    Json failureMembers_ = Json::object();
    PhaseRecord confirmed_;    ///< the phases as they were when what was read was confirmed last
    std::string doubt_;        ///< why it can't be confirmed any more
    bool identified_ = false;  ///< the device was reached, and its properties are known
    bool comparesBytes_ = false;
    bool closing_ = false;  ///< after a failure
    bool haltFailed_ = false;
    bool runsAtEnd_ = false;
};

}  // namespace host
