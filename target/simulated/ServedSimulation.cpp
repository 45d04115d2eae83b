// Memory by the rules of the flash cells, registers kept for their own sake.

#include "target/simulated/ServedSimulation.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

#include "base/ByteOrder.h"
#include "target/simulated/Loader.h"
#include "target/simulated/Ram.h"

namespace target {

namespace {

// The core executes nothing. What its registers say is what a debugger wrote, but for pc: it
// decides at each start whether the loader begins (in RAM that was written), goes on (where it was
// halted) or the core runs what is in flash.

constexpr std::uint32_t kPeripheralStart = 0x40000000;
constexpr std::uint32_t kPeripheralSizeBytes = 0x20000000;

// Behind its first instruction the loader is in its loop, so that nobody takes it for unstarted.
constexpr std::uint32_t kInsideLoader = 4;

}  // namespace

ServedSimulation::ServedSimulation(SimulatedDevice& device,
                                   std::function<void(const std::string&)> complain,
                                   std::function<void()> clientGone)
    : device_(device),
      complain_(std::move(complain)),
      clientGone_(std::move(clientGone)),
      writtenWords_(device.Options().ramSizeBytes / 4) {
    ResetRegisters();
}

std::vector<gdb::MemoryRegion> ServedSimulation::Regions() const {
    const DeviceOptions& options = device_.Options();
    return {{0, options.flashSizeBytes, options.sectorSizeBytes},
            {Ram::kStart, options.ramSizeBytes, 0},
            {kPeripheralStart, kPeripheralSizeBytes, 0}};
}

std::string ServedSimulation::Read(std::uint32_t address, std::size_t sizeBytes,
                                   std::size_t width) {
    std::string bytes(sizeBytes, '\0');
    Do([&] { device_.Read(bytes.data(), sizeBytes / width, address, kGeneralPage, width); });
    return bytes;
}

void ServedSimulation::Write(std::uint32_t address, std::string_view bytes, std::size_t width) {
    Do([&] { device_.Write(bytes.data(), bytes.size() / width, address, kGeneralPage, width); });
    if (address < Ram::kStart || bytes.empty()) return;
    const std::size_t first = (address - Ram::kStart) / 4;
    const std::size_t last = (address - Ram::kStart + bytes.size() - 1) / 4;
    for (std::size_t word = first; word <= last && word < writtenWords_.size(); ++word)
        writtenWords_[word] = true;
}

// A server's own flash packets bypass the flash controller: a real server has an algorithm of its
// own for them, which keeps every rule.
void ServedSimulation::EraseFlash(std::uint32_t address, std::uint32_t sizeBytes) {
    const std::uint32_t sector = device_.Options().sectorSizeBytes;
    if (address % sector != 0 || sizeBytes % sector != 0)
        throw TargetError(
            fmt::format("Erasing {} bytes at 0x{:08X}: the device erases whole sectors of {} bytes",
                        sizeBytes, address, sector));
    // The flash may end inside its last sector, which clients erase whole.
    const std::uint64_t end = std::uint64_t{address} + sizeBytes;
    const std::uint64_t beyond = end - std::min<std::uint64_t>(end, device_.Flash().SizeBytes());
    if (beyond < std::min(sector, sizeBytes)) sizeBytes -= static_cast<std::uint32_t>(beyond);
    RequireFlash(address, sizeBytes);
    device_.Flash().Erase(address, sizeBytes);
}

void ServedSimulation::ProgramFlash(std::uint32_t address, std::string_view bytes) {
    RequireFlash(address, bytes.size());
    const auto* first = reinterpret_cast<const std::uint8_t*>(bytes.data());
    if (const auto at = device_.Flash().Program(address, {first, bytes.size()}))
        throw TargetError(fmt::format("Programming {} bytes at 0x{:08X}: 0x{:08X} isn't erased",
                                      bytes.size(), address, *at));
}

void ServedSimulation::Start() {
    if (IsRunning()) return;
    const std::uint32_t pc = registers_.values[gdb::CoreRegisters::kPc];
    const bool goesOn = inLoader_ && pc == haltedAt_;
    Do([&] {
        if (goesOn || !WasWritten(pc)) return device_.Continue();
        device_.LoadProgram(Loader::kFileName, "");
        device_.Run();
    });
    inLoader_ = goesOn || WasWritten(pc);
    haltedAt_ = goesOn ? pc : pc + kInsideLoader;
}

// A debugger that looks at the halted loader finds it inside of its loop.
void ServedSimulation::Stop() {
    const bool ran = IsRunning();
    Do([&] { device_.Halt(); });
    if (ran && inLoader_) registers_.values[gdb::CoreRegisters::kPc] = haltedAt_;
}

// The core is left at the program in flash, as the registers say: the boot ROM has run.
void ServedSimulation::Reset() {
    Do([&] {
        device_.Halt();
        device_.Reset(true);
        device_.Continue();
        device_.Halt();
    });
    ResetRegisters();
}

/// What the device lets pass and a real one would ignore is worth a word as well. A refusal is for
/// the caller.
void ServedSimulation::Do(const std::function<void()>& action) {
    std::string refusal;
    try {
        action();
    } catch (const TargetError& error) {
        refusal = error.what();
    }
    for (const std::string& text : device_.TakeViolations())
        if (text != refusal) complain_(text);
    if (!refusal.empty()) throw TargetError(refusal);
}

void ServedSimulation::RequireFlash(std::uint32_t address, std::size_t sizeBytes) const {
    if (device_.Flash().Contains(address, sizeBytes)) return;
    throw TargetError(fmt::format("{} bytes at 0x{:08X}: the device has {} bytes of flash",
                                  sizeBytes, address, device_.Flash().SizeBytes()));
}

// Whether somebody loaded something there. Nothing ever makes a word unwritten again but a new
// device: RAM keeps its contents through a reset.
bool ServedSimulation::WasWritten(std::uint32_t address) const {
    if (address < Ram::kStart) return false;
    const std::size_t word = (address - Ram::kStart) / 4;
    return word < writtenWords_.size() && writtenWords_[word];
}

// As the vectors at the start of the flash say.
void ServedSimulation::ResetRegisters() {
    std::uint8_t vectors[8];
    device_.Flash().Read(0, vectors);
    registers_ = {};
    registers_.values[gdb::CoreRegisters::kSp] = base::LoadWord(vectors);
    registers_.values[gdb::CoreRegisters::kPc] = base::LoadWord(vectors + 4) & ~std::uint32_t{1};
    registers_.values[gdb::CoreRegisters::kStatus] = 0x01000000;
    inLoader_ = false;
}

}  // namespace target
