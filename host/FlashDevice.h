// A device that is ready to be worked on: the target, the loaded plug-in and the device object that
// it made. Every call into the plug-in goes through here, so that a failure of any kind (an error
// text, an error that was only shown, Ctrl-C) ends a command in the same way.

#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "host/CommandTable.h"
#include "host/Errors.h"
#include "host/FlashHost.h"
#include "host/PluginLibrary.h"
#include "host/SimulatedTarget.h"
#include "host/Text.h"
#include "host/Trace.h"
#include "host/TracingHost.h"
#include "host/WorkMeter.h"
#include "host/image/Image.h"

namespace host {

/// What the plug-in has found out about the device.
struct DeviceInfo {
    std::string family;
    std::uint64_t flashBytes = 0;
    std::uint64_t ramBytes = 0;
    std::uint32_t sectorBytes = 0;
    bool hasFlash = false;
    std::string operations;  ///< joined by " | "

    AddressRange Flash() const { return {0, static_cast<std::uint32_t>(flashBytes - 1)}; }
};

/// A failure that the user has already been shown; `Remark` is what is left to say,
/// `Result` what is known for the JSON lines.
class ShownFailure : public Failure {
  public:
    ShownFailure(ExitStatus status, const std::string& text, std::string remark,
                 Json result = Json::object())
        : Failure(status, text), remark_(std::move(remark)), result_(std::move(result)) {}

    const std::string& Remark() const { return remark_; }
    const Json& Result() const { return result_; }

  private:
    std::string remark_;
    Json result_;
};

class FlashDevice {
  public:
    /// Failure (Unreachable) when plug-in or target can't be had.
    explicit FlashDevice(Context& context);

    const DeviceInfo& Info() const { return info_; }
    std::string LibraryPath() const { return library_.Path(); }
    WorkMeter& Meter() { return meter_; }

    /// Whether the byte at an address lies in flash, by the plug-in's own answer.
    bool Contains(std::uint32_t address);

    /// The range of a command, the whole flash when none was given. Failure (WrongUsage) when it
    /// doesn't lie in flash, Failure (DeviceFailed) when there is no flash.
    AddressRange RangeInFlash(const std::optional<std::string>& text);

    /// Failure (DeviceFailed) for a device whose flash the plug-in can't work on.
    void RequireFlash() const;

    void ResetSettings(int mode);
    void WriteSection(const image::Section& section);

    /// Runs a named operation, its messages shown at `level`.
    void Perform(const std::string& operation, Talk level = Talk::Normal);

    /// Reads flash of the halted target, counting the bytes for the running phase.
    std::vector<std::uint8_t> ReadFlash(const AddressRange& range);
    void Halt();

    /// Keeps the simulated device's contents, where a file was named for them.
    void Save() const { target_.Save(meter_.ContentsTouched()); }

  private:
    struct Destroyer {
        void operator()(IFlashDevice2* device) const { device->Destroy(); }
    };

    IFlashHost& Host() { return tracingHost_ ? static_cast<IFlashHost&>(*tracingHost_) : host_; }
    void Create();
    void Initialize();
    void Announce(const std::string& call);
    void Finish(const char* error, const std::string& doing);
    [[noreturn]] void FailAsShown(const std::string& text, const std::string& doing);
    std::string StateOfFlash() const;
    std::string Advice() const;

    Context& context_;
    SimulatedTarget target_;
    WorkMeter meter_;
    FlashHost host_;
    std::optional<Trace> trace_;
    std::optional<TracingHost> tracingHost_;
    PluginLibrary library_;
    std::optional<PluginTrace> pluginTrace_;
    std::unique_ptr<IFlashDevice2, Destroyer> device_;
    DeviceInfo info_;
    std::size_t errorsSeen_ = 0;
};

/// Runs a command's work on the device. Whatever becomes of it, the simulated device's contents
/// are kept, except after a mere look (`dryRun`).
Outcome WithDevice(Context& context, const std::function<Outcome(FlashDevice&)>& work);

}  // namespace host
