// SimulatedDevice: a Corvane microcontroller as it looks through a debug probe: flash at 0, RAM at
// 0x20000000, registers above, and a core that runs the flash loader.
//
// It is as strict as silicon, and where a debug port could tell, it tells: such an access is a
// TargetError that names the broken rule. What silicon loses without a word (a command that comes
// too soon, a chunk for flash that isn't ready) is lost here as well, and the log of the rules
// alone has it. docs/simulated-device.md lists what the device wants. Time is simulated: it goes on
// with every pause, with what each access costs, and with the injected clock. There is no thread;
// each access first brings the device up to now.

#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "target/Target.h"
#include "target/simulated/Clock.h"
#include "target/simulated/FlashArray.h"
#include "target/simulated/FlashController.h"
#include "target/simulated/Loader.h"
#include "target/simulated/MemoryMap.h"
#include "target/simulated/Ram.h"
#include "target/simulated/RegisterFile.h"
#include "target/simulated/Rules.h"
#include "target/simulated/SimulatedTime.h"
#include "target/simulated/SystemControl.h"
#include "target/simulated/options/DeviceOptions.h"

namespace target {

class SimulatedDevice final : public Target {
  public:
    /// A device in its power-up state, running the (empty) program in its flash. `clock` is not
    /// owned and must outlive the device; null means the steady clock. Throws OptionError when
    /// the options make no device.
    explicit SimulatedDevice(const DeviceOptions& options, Clock* clock = nullptr);

    SimulatedDevice(const SimulatedDevice&) = delete;
    SimulatedDevice& operator=(const SimulatedDevice&) = delete;

    void Read(void* buffer, std::size_t count, std::uint32_t address, int page,
              std::size_t width) override;
    void Write(const void* buffer, std::size_t count, std::uint32_t address, int page,
               std::size_t width) override;
    void LoadProgram(const std::string& fileName, const std::string& directory) override;
    void Run() override;
    void Halt() override;
    void Reset(bool flag) override;
    std::chrono::nanoseconds Now() const override { return time_.Now(); }
    void Pause(std::chrono::nanoseconds time) override;
    bool SimulatesTime() const override { return true; }

    /// Lets the halted core go on where it was. Other than after Run, the loader keeps what it had
    /// not finished; without one, the core runs on with nothing that shows outside.
    void Continue();

    /// What a probe does in one order, by a flash algorithm of its own, which keeps every rule: an
    /// erase sets whole sectors to ones, programming clears bits. The modelled times and faults
    /// hold for it.
    void EraseByProbe(std::uint32_t address, std::uint32_t sizeBytes);
    void ProgramByProbe(std::uint32_t address, std::string_view bytes);

    // What follows is for tests and tools: it counts as no access, costs no simulated time and
    // breaks no rule.

    const DeviceOptions& Options() const { return options_; }

    /// Off and on again: RAM, registers and everything in progress are lost; flash and committed
    /// user registers stay. Counters, violations and simulated time go on.
    void PowerCycle();

    /// The whole flash as it reads now, work in progress not included.
    std::vector<std::uint8_t> FlashContents() const;

    /// The flash cells themselves, to be looked at or preset.
    const FlashArray& Flash() const { return flash_; }
    FlashArray& Flash() { return flash_; }

    std::array<std::uint32_t, 2> CommittedUserRegisters() const;
    void PresetCommittedUserRegisters(const std::array<std::uint32_t, 2>& values);

    /// The register's value as of the last access. Throws TargetError where there is none.
    std::uint32_t PeekRegister(std::uint32_t address) const;

    /// One text for every rule that was broken, whether or not the access was refused: what was
    /// done, where, and the rule's name in brackets. At most RuleLog::kTextsMax are kept.
    const std::vector<std::string>& Violations() const { return rules_.Texts(); }

    /// The same, and forgets them.
    std::vector<std::string> TakeViolations() { return rules_.Take(); }

    std::uint64_t AccessCount() const { return accessCount_; }
    bool IsRunning() const { return running_; }

    /// How much simulated time went where.
    TimeSpent Time() const { return time_.Spent(); }
    std::chrono::nanoseconds LoaderBusyTime() const { return loader_.BusyTime(); }

  private:
    template <typename Describe, typename Action>
    void Perform(std::uint64_t sizeBytes, const Describe& describe, const Action& action);
    void AdvanceToNow();
    const char* RequestedFault() const;
    CoreState Core() const;
    void StopCore();
    std::uint32_t RequireSectors(std::uint32_t address, std::uint32_t sizeBytes) const;
    void RequireFlash(std::uint32_t address, std::uint64_t sizeBytes) const;

    const DeviceOptions options_;
    RuleLog rules_;
    SimulatedTime time_;
    FlashArray flash_;
    Ram ram_;
    RegisterFile registers_;
    SystemControl system_;
    FlashController controller_;
    Loader loader_;
    MemoryMap memory_;
    std::uint64_t accessCount_ = 0;
    bool running_ = false;
    bool programLoaded_ = false;
};

}  // namespace target
