// Memory by the rules of the flash cells, registers kept for their own sake.

#include "target/simulated/ServedSimulation.h"

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

// Clients know nothing of pages.
std::string WithoutPage(std::string text) {
    constexpr std::string_view kPage = " on page 1";
    if (const std::size_t at = text.find(kPage); at != std::string::npos)
        text.erase(at, kPage.size());
    return text;
}

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

void ServedSimulation::EraseFlash(std::uint32_t address, std::uint32_t sizeBytes) {
    Do([&] { device_.EraseByProbe(address, sizeBytes); });
}

void ServedSimulation::ProgramFlash(std::uint32_t address, std::string_view bytes) {
    Do([&] { device_.ProgramByProbe(address, bytes); });
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
        if (text != refusal) complain_(WithoutPage(text));
    if (!refusal.empty()) throw TargetError(WithoutPage(refusal));
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
