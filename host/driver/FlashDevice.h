// A device that is ready to be worked on: the target, the loaded plug-in and the device object that
// it made. Every call into the plug-in goes through here, so that a failure of any kind (an error
// text, an error that was only shown, Ctrl-C) ends a command in the same way.

#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "host/base/Errors.h"
#include "host/base/Text.h"
#include "host/driver/FlashHost.h"
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

/// What the plug-in has found out about the device.
struct DeviceInfo {
    std::string family;
    std::uint64_t flashBytes = 0;
    std::uint64_t ramBytes = 0;
    std::uint32_t sectorBytes = 0;
    std::uint32_t identification = 0;
    bool hasFlash = false;
    std::string operations;  ///< joined by " | "

    base::AddressRange Flash() const { return {0, static_cast<std::uint32_t>(flashBytes - 1)}; }
};

/// A failure of the device or the plug-in. Part of it may have been shown already: `Remark` is what
/// is left to say, `Result` what is known for the JSON lines.
class DeviceFailure : public Failure {
  public:
    DeviceFailure(ExitStatus status, const std::string& text, std::string remark, Json result)
        : Failure(status, text), remark_(std::move(remark)), result_(std::move(result)) {}

    const std::string& Remark() const { return remark_; }
    const Json& Result() const { return result_; }

  private:
    std::string remark_;
    Json result_;
};

/// Which target, through which plug-in, and what traces it: null, or a trace that outlives the
/// device.
struct DeviceOptions {
    TargetOptions target;
    std::optional<std::string> plugin;
    Trace* trace = nullptr;
};

/// What becomes of a simulated device's contents at the end.
enum class Contents { Kept, LeftAlone };

class FlashDevice {
  public:
    /// Failure (Unreachable) when plug-in or target can't be had.
    FlashDevice(const DeviceOptions& options, SettingStore& settings, Reporter& reporter);

    const DeviceInfo& Info() const { return info_; }
    std::string LibraryPath() const { return library_.Path(); }
    SettingStore& Settings() { return settings_; }
    Reporter& Output() { return reporter_; }
    WorkMeter& Meter() { return meter_; }
    const FlashWork& Work() const { return watch_.Work(); }
    const RegisterWatch& Registers() const { return host_.Registers(); }

    /// Whether the byte at an address lies in flash, by the plug-in's own answer.
    bool Contains(std::uint32_t address);

    /// The range of a command, the whole flash when none was given. Failure (WrongUsage) when it
    /// doesn't lie in flash, Failure (DeviceFailed) when there is no flash.
    base::AddressRange RangeInFlash(const std::optional<std::string>& text);

    /// Failure (DeviceFailed) for a device whose flash the plug-in can't work on.
    void RequireFlash() const;

    void ResetSettings(plugin::ResetMode mode);

    /// Hands a section to the plug-in and waits until the loader is done with it; then the target
    /// is halted.
    void WriteSection(const image::Section& section);

    /// How long the loader may take for the last chunk of a section.
    void LimitLastChunk(std::chrono::milliseconds limit) { loader_.SetLimit(limit); }

    /// Runs a named operation, its messages shown at `level`.
    void Perform(const std::string& operation, Talk level = Talk::Normal);

    /// What the last call has published. Failure (DeviceFailed) when it is nothing.
    std::string Published(const std::string& key) const;

    /// Adds to what the JSON lines of a failure say: the command's plan, for one.
    void Know(const Json& members) { known_.update(members); }

    /// Reads flash of the halted target, counting the bytes for the running phase.
    std::vector<std::uint8_t> ReadFlash(const base::AddressRange& range);
    std::uint32_t ReadUserRegister(unsigned index);
    void Halt();

    /// Ends the work after a failure of any kind, Ctrl-C included.
    void LeaveHalted();

    void Reset();

    /// Resets the device and prepares it to run its own program, which begins when the device is
    /// closed.
    void StartProgram();

    /// The last thing done with a device: a simulated one's contents are kept, where a file was
    /// named for them, and the target is left halted or starts its program. Failure.
    void Close(Contents contents);

  private:
    struct Destroyer {
        void operator()(IFlashDevice2* device) const { device->Destroy(); }
    };

    IFlashHost& Host() { return tracingHost_ ? static_cast<IFlashHost&>(*tracingHost_) : host_; }
    void Create();
    void Initialize();
    template <typename Action>
    void Call(const std::string& doing, const std::string& traced, Action&& action);
    [[noreturn]] void Fail(const std::string& error, const std::string& doing);
    [[noreturn]] void FailAsNotBlank(const NotBlank& found, const std::string& error,
                                     const std::string& state, Json known);
    RegisterValues TryUserRegisters();
    std::string State(const RegisterValues& registers) const;
    std::string AwaitLoader();
    std::string StateOfFlash() const;
    std::string Advice() const;

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
    Json known_ = Json::object();
    bool reached_ = false;  ///< the device was identified, and its properties are known
    bool closing_ = false;  ///< after a failure
    bool haltFailed_ = false;
    bool runsAtEnd_ = false;
};

}  // namespace host
