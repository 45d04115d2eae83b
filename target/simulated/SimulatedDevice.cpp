// The debug port of the simulated device: every access pays its time, brings the device up to now,
// may fail on request, and is then carried out or refused.

#include "target/simulated/SimulatedDevice.h"

#include <fmt/format.h>

#include <algorithm>
#include <type_traits>

// What every access may rely on, and leaves behind, also when it fails:
// - Controller and loader have been brought up to the time of the access before it is carried out.
// - The core is halted, runs the loader, or runs what is in flash. The loader is at work in the
// second
//   case only; the third needs no time and changes nothing.
// - An access that is refused has changed nothing, but for a transfer to several registers, of
// which
//   those before the refused one are written. It has cost its time and counts as an access.

namespace target {

namespace {

const DeviceOptions& Checked(const DeviceOptions& options) {
    CheckDeviceOptions(options);
    return options;
}

}  // namespace

SimulatedDevice::SimulatedDevice(const DeviceOptions& options, Clock* clock)
    : options_(Checked(options)),
      time_(options_.timings, clock),
      flash_(options_.flashSizeBytes, options_.faults.stuckCell),
      ram_(options_.ramSizeBytes),
      registers_(options_),
      system_(options_, registers_, rules_),
      controller_(options_, registers_, system_, flash_, rules_),
      loader_(options_, ram_, flash_, controller_, rules_),
      memory_(options_, flash_, ram_, registers_, system_, controller_, loader_) {
    PowerCycle();
}

// The text of an access is put together only when somebody is told of it: a load has thousands.
void SimulatedDevice::Read(void* buffer, std::size_t count, std::uint32_t address, int page,
                           std::size_t width) {
    const Transfer transfer{count, address, page, width};
    const auto describe = [&] {
        return fmt::format("Reading {} x {} bytes at {:#x} on page {}", count, width, address,
                           page);
    };
    Perform(transfer.SizeBytes(), describe,
            [&] { memory_.Read(transfer, static_cast<std::uint8_t*>(buffer), time_.Now()); });
}

void SimulatedDevice::Write(const void* buffer, std::size_t count, std::uint32_t address, int page,
                            std::size_t width) {
    const Transfer transfer{count, address, page, width};
    const auto describe = [&] {
        return fmt::format("Writing {} x {} bytes at {:#x} on page {}", count, width, address,
                           page);
    };
    Perform(transfer.SizeBytes(), describe, [&] {
        memory_.Write(transfer, static_cast<const std::uint8_t*>(buffer), Core(), time_.Now());
    });
}

void SimulatedDevice::LoadProgram(const std::string& fileName, const std::string& directory) {
    const auto describe = [&] {
        return fmt::format(R"(Loading the program "{}" from "{}")", fileName, directory);
    };
    Perform(0, describe, [&] {
        if (running_) Refuse(rule::kHaltedForLoad, "the target is running; halt it first");
        if (fileName != Loader::kFileName) {
            Refuse(rule::kKnownProgram,
                   fmt::format("no such program; this device has only \"{}\"", Loader::kFileName));
        }
        programLoaded_ = true;
    });
}

// The loader is all that can be run: a program in flash is the same as none to whoever looks from
// outside.
void SimulatedDevice::Run() {
    Perform(0, "Running the target", [&] {
        if (running_) Refuse(rule::kHaltedForRun, "the target is running already");
        if (!programLoaded_) {
            Refuse(rule::kLoadedForRun, "no program has been loaded since the last reset");
        }
        running_ = true;
        loader_.Start();
    });
}

// Halting a halted core is no mistake, and neither is letting a running one go on.
void SimulatedDevice::Halt() {
    Perform(0, "Halting the target", [&] { StopCore(); });
}

void SimulatedDevice::Continue() {
    Perform(0, "Letting the target go on", [&] {
        running_ = true;
        if (!programLoaded_) system_.RunBootRom();
        loader_.Continue(time_.Now());
    });
}

// With the flag it is a system reset, which reaches the peripherals, and without it one of the core
// alone. Either leaves the core halted before the first instruction of the boot ROM.
void SimulatedDevice::Reset(bool flag) {
    Perform(0, "Resetting the target", [&] {
        system_.Reset(flag, Core(), time_.Now());
        StopCore();
        loader_.Forget();
        controller_.Reset();
        registers_.Reset();
        programLoaded_ = false;
    });
}

void SimulatedDevice::Pause(std::chrono::nanoseconds time) {
    time_.AddPause(time);
    AdvanceToNow();
}

void SimulatedDevice::EraseByProbe(std::uint32_t address, std::uint32_t sizeBytes) {
    const std::string describe = fmt::format("Erasing {} bytes at {:#x}", sizeBytes, address);
    Perform(0, describe, [&] {
        const std::uint32_t size = RequireSectors(address, sizeBytes);
        if (options_.faults.eraseNeverEnds) throw TargetError(describe + ": it doesn't end");
        const std::uint32_t sector = options_.sectorSizeBytes;
        time_.AddPause((size + sector - 1) / sector * options_.timings.sectorErase);
        flash_.Erase(address, size);
    });
}

void SimulatedDevice::ProgramByProbe(std::uint32_t address, std::string_view bytes) {
    const std::string describe =
        fmt::format("Programming {} bytes at {:#x}", bytes.size(), address);
    Perform(bytes.size(), describe, [&] {
        RequireFlash(address, bytes.size());
        const std::size_t chunks = (bytes.size() + Loader::kChunkMax - 1) / Loader::kChunkMax;
        time_.AddPause(chunks * options_.timings.chunk);
        const auto* first = reinterpret_cast<const std::uint8_t*>(bytes.data());
        if (const auto at = flash_.Program(address, {first, bytes.size()}))
            throw TargetError(fmt::format("{}: {:#x} isn't erased", describe, *at));
    });
}

/// The size without what lies beyond the flash, which may end inside its last sector: clients erase
/// that whole.
std::uint32_t SimulatedDevice::RequireSectors(std::uint32_t address,
                                              std::uint32_t sizeBytes) const {
    const std::uint32_t sector = options_.sectorSizeBytes;
    if (address % sector != 0 || sizeBytes % sector != 0)
        throw TargetError(
            fmt::format("Erasing {} bytes at {:#x}: the device erases whole sectors of {} bytes",
                        sizeBytes, address, sector));
    const std::uint64_t end = std::uint64_t{address} + sizeBytes;
    const std::uint64_t beyond = end - std::min<std::uint64_t>(end, flash_.SizeBytes());
    if (beyond < std::min(sector, sizeBytes)) sizeBytes -= static_cast<std::uint32_t>(beyond);
    RequireFlash(address, sizeBytes);
    return sizeBytes;
}

void SimulatedDevice::RequireFlash(std::uint32_t address, std::uint64_t sizeBytes) const {
    if (flash_.Contains(address, sizeBytes)) return;
    throw TargetError(fmt::format("{} bytes at {:#x}: the device has {} bytes of flash", sizeBytes,
                                  address, flash_.SizeBytes()));
}

template <typename Describe, typename Action>
void SimulatedDevice::Perform(std::uint64_t sizeBytes, const Describe& describe,
                              const Action& action) {
    const auto text = [&describe]() -> std::string {
        if constexpr (std::is_invocable_v<Describe>) {
            return describe();
        } else {
            return describe;
        }
    };
    // A failed access has cost its time all the same: the link was busy.
    ++accessCount_;
    time_.AddAccess(sizeBytes);
    AdvanceToNow();
    if (const char* fault = RequestedFault()) {
        throw TargetError(fmt::format("{}: the connection to the target failed at access {} [{}]",
                                      text(), accessCount_, fault));
    }
    try {
        action();
    } catch (const RuleBroken& error) {
        const std::string refusal = text() + ": " + error.what();
        rules_.Record(refusal);
        throw TargetError(refusal);
    }
    AdvanceToNow();  // The loader sees at once what was handed over to it.
}

// The controller first: the loader waits for the end of a command and goes on at the same moment.
void SimulatedDevice::AdvanceToNow() {
    const auto now = time_.Now();
    controller_.AdvanceTo(now);
    loader_.AdvanceTo(now);
}

const char* SimulatedDevice::RequestedFault() const {
    const Faults& faults = options_.faults;
    if (accessCount_ == faults.failAccess) return "fail-access";
    if (faults.failFrom != 0 && accessCount_ >= faults.failFrom) return "fail-from";
    return nullptr;
}

CoreState SimulatedDevice::Core() const {
    return !running_        ? CoreState::Halted
           : programLoaded_ ? CoreState::RunsLoader
                            : CoreState::RunsFlash;
}

// The loader first: of the chunk at work it programs what it got done by now.
void SimulatedDevice::StopCore() {
    loader_.Stop();
    running_ = false;
}

// What is at work is cut off as by a reset; then the volatile part is new. What the flash cells and
// the committed registers hold is all that is left.
void SimulatedDevice::PowerCycle() {
    StopCore();
    loader_.Forget();
    controller_.Reset();
    registers_.PowerUp();
    system_.PowerUp();
    ram_.LosePower();
    programLoaded_ = false;
    running_ = true;
}

std::vector<std::uint8_t> SimulatedDevice::FlashContents() const {
    std::vector<std::uint8_t> contents(flash_.SizeBytes());
    flash_.Read(0, contents);
    return contents;
}

std::array<std::uint32_t, 2> SimulatedDevice::CommittedUserRegisters() const {
    if (!registers_.Has(reg::kUserRegister0)) return {0xFFFFFFFF, 0xFFFFFFFF};
    return {registers_.ResetValue(reg::kUserRegister0), registers_.ResetValue(reg::kUserRegister1)};
}

void SimulatedDevice::PresetCommittedUserRegisters(const std::array<std::uint32_t, 2>& values) {
    std::uint32_t address = reg::kUserRegister0;
    // Both the value that a reset brings and the one that reads now, as after power-up.
    for (const std::uint32_t value : values) {
        if (!registers_.Has(address)) return;
        registers_.SetResetValue(address, value);
        registers_.Write(address, value);
        address += 4;
    }
}

std::uint32_t SimulatedDevice::PeekRegister(std::uint32_t address) const {
    try {
        return memory_.PeekRegister(address, time_.Now());
    } catch (const RuleBroken& error) {
        throw TargetError(error.what());
    }
}

}  // namespace target
