// A host that drives a simulated device, writes down every call and trace line in one transcript,
// and fails any call that a test chooses.

#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "plugin/IFlashDevice2.h"
#include "target/simulated/SimulatedDevice.h"
#include "tests/support/StrictHost.h"
#include "tests/support/VirtualTime.h"

namespace test {

using Settings = std::map<std::string, std::string>;

/// All that the plug-in asks for, as an ordinary user has it.
const Settings& OrdinarySettings();

/// Which calls fail: the first-th, counted from 1, and the `count` - 1 after it. GetDirectory
/// cannot fail and is not counted. A failing GetProperty does not know the setting.
struct Fault {
    std::uint64_t first = 0;
    std::uint64_t count = 1;
    std::string text = "injected failure";
};

class RecordingHost final : public StrictHost {
  public:
    /// A device as ParseDeviceOptions takes it. The settings are those of an ordinary user, with
    /// the given ones on top.
    explicit RecordingHost(const std::string& deviceOptions = "tolva", Settings changes = {});
    ~RecordingHost();
    RecordingHost(const RecordingHost&) = delete;
    RecordingHost& operator=(const RecordingHost&) = delete;

    target::SimulatedDevice& Device() { return *device_; }

    /// From now on the calls go to that target, which passes on what it likes to the device.
    void PutInFront(target::Target& target) { target_ = &target; }

    Settings settings;
    Fault fault;
    std::string failNext;  ///< the next call whose line begins so fails as well
    bool transcribe = false;

    std::vector<std::string> transcript;
    std::vector<std::string> errors;  ///< shown, whether or not the showing failed
    std::vector<std::string> messages;
    std::uint64_t calls = 0;
    int openDisplays = 0;
    bool displayMisused = false;           ///< begun twice, or ended or updated without being begun
    std::vector<std::string> failedCalls;  ///< those that were made to fail
    const void* data = nullptr;            ///< shown as DATA in trace lines

    /// Starts counting calls anew, with that fault, and forgets what was shown.
    void Restart(Fault next);

    const char* GetProperty(const char* name) override;
    const char* SetProperty(const char* name, const char* value) override;
    const char* LoadProgram(const char* fileName, const char* second,
                            const char* directory) override;
    const char* RunTarget() override;
    const char* HaltTarget() override;
    const char* ResetTarget(bool flag) override;
    const char* ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                           size_t width) override;
    const char* WriteMemory(const void* buffer, size_t count, uint64_t address, int16_t page,
                            size_t width) override;
    const char* BeginProgress(const char* title) override;
    const char* UpdateProgress(uint32_t percent, const char* text) override;
    const char* EndProgress() override;
    const char* ShowError(const char* text) override;
    const char* ShowMessage(const char* text) override;
    const char* GetDirectory() override;
    const char* Sleep(uint32_t milliseconds) override;

  private:
    bool Fails(const std::string& line);
    void Note(const std::string& line);
    void NoteTrace(int level, std::string text);
    const char* Answer(
        const std::string& line, const std::function<void()>& action = [] {});

    VirtualClock clock_;
    std::unique_ptr<target::SimulatedDevice> device_;
    target::Target* target_;  ///< what is driven
    std::string bytesRead_;   ///< by the call, as its line shows them
    std::string answer_;      ///< what the last call returned; gone with the next one
};

/// Loads the built plug-in once and creates a device object; throws std::runtime_error with the
/// text of a failing creation.
class Plugin {
  public:
    explicit Plugin(IFlashHost& host);

    IFlashDevice2* operator->() const { return device_.get(); }

  private:
    struct Destroyer {
        void operator()(IFlashDevice2* device) const { device->Destroy(); }
    };
    std::unique_ptr<IFlashDevice2, Destroyer> device_;
};

/// The exported function of the built library.
CreateFlashDevice2Function Factory();

/// What a call returned: "" for success.
inline std::string TextOf(const char* error) {
    if (error == nullptr) return "";
    return *error == '\0' ? "(empty text)" : error;
}

}  // namespace test
