// Registers: that something answers, that words come the right way round, and that one keeps what
// is written to it. The flash address register is written because nothing comes of that alone.

#include "device/RegisterMap.h"
#include "hostcheck/Checks.h"
#include "hostcheck/RamWindow.h"

namespace hostcheck {

namespace {

// What a bus reads that nothing drives.
std::string Identifies(CheckedHost& host) {
    const std::uint32_t word = host.ReadWord(Register::DeviceIdentification0);
    if (word == 0 || word == 0xFFFFFFFF) throw Breach(HexWord(word) + ": nothing answers");
    return "it reads " + HexWord(word);
}

std::string ReadsRam(CheckedHost& host) {
    host.ReadWord(RamWindow::kStart);
    return "";
}

std::uint32_t Turned(std::uint32_t word) {
    return word << 24 | (word & 0xFF00) << 8 | (word >> 8 & 0xFF00) | word >> 24;
}

std::uint32_t AsItIs(std::uint32_t word) {
    return word;
}

/// Whether the device has as much flash and RAM as a microcontroller has, and room for the loader,
/// when every register is taken in that order of bytes.
bool IsPlausible(CheckedHost& host, std::uint32_t (*order)(std::uint32_t)) try {
    const auto read = [&](std::uint32_t address) { return order(host.ReadWord(address)); };
    std::uint64_t flashField = 0;
    std::uint64_t ramField = 0;
    if ((read(Register::DeviceIdentification0) >> 16 & 0xFF) < 8) {
        const std::uint32_t capabilities = read(Register::DeviceCapabilities0);
        flashField = capabilities & 0xFFFF;
        ramField = capabilities >> 16;
    } else {
        flashField = read(Register::FlashSize) & 0xFFFF;
        ramField = read(Register::SramSize);
    }
    constexpr std::uint64_t most = std::uint64_t{16} << 20;
    const std::uint64_t ram = (ramField + 1) * 256;
    return ram > LoaderMemory::ParameterBlocks - LoaderMemory::Buffers && ram < most &&
           (flashField + 1) * 2048 <= most;
} catch (const Breach&) {
    return false;
}

// Written and read the wrong way round, a word looks right; the sizes of the device don't.
std::string LowByteFirst(CheckedHost& host) {
    const std::uint32_t word = host.ReadWord(Register::DeviceIdentification0);
    if (IsPlausible(host, AsItIs)) return "";
    if (IsPlausible(host, Turned))
        throw Breach(HexWord(word) + " for " + HexWord(Turned(word)) +
                     ", with which alone the sizes make sense");
    throw NotChecked("the sizes of the device make no sense either way");
}

/// Puts the flash address register back.
class FlashAddressKept {
  public:
    explicit FlashAddressKept(CheckedHost& host)
        : host_(host), before_(host.ReadWord(Register::FlashAddress)) {}
    FlashAddressKept(const FlashAddressKept&) = delete;
    FlashAddressKept& operator=(const FlashAddressKept&) = delete;
    ~FlashAddressKept() {
        try {
            host_.WriteWord(Register::FlashAddress, before_);
        } catch (const std::exception&) {
            // The check that failed to write says so.
        }
    }

  private:
    CheckedHost& host_;
    std::uint32_t before_;
};

void RequireRegister(CheckedHost& host, std::uint32_t value, const char* when) {
    const std::uint32_t came = host.ReadWord(Register::FlashAddress);
    if (came != value) throw Breach(HexWord(came) + " instead of " + HexWord(value) + when);
}

// Sectors of every device begin at these addresses. Their bytes differ, so that a write of single
// bytes shows.
std::string KeepsARegister(CheckedHost& host) {
    const FlashAddressKept kept(host);
    for (const std::uint32_t value : {0x00008000U, 0x00004000U, 0x00000000U}) {
        host.WriteWord(Register::FlashAddress, value);
        RequireRegister(host, value, "");
    }
    return "";
}

std::string HaltResetsNothing(CheckedHost& host) {
    const FlashAddressKept kept(host);
    host.WriteWord(Register::FlashAddress, 0x00004000);
    host.Halt();
    RequireRegister(host, 0x00004000, " after the halt");
    return "";
}

constexpr Check kRegisterChecks[] = {
    {Stage::Creation, "ReadMemory", "the identification register at 0x400FE000", Identifies},
    {Stage::Creation, "ReadMemory", "a word of RAM during CreateFlashDevice2", ReadsRam},
    {Stage::Initialize, "ReadMemory", "registers with the least significant byte first",
     LowByteFirst},
    {Stage::Initialize, "WriteMemory", "the flash address register at 0x400FD000 as it was written",
     KeepsARegister},
    {Stage::Initialize, "HaltTarget", "registers as they were", HaltResetsNothing},
};

}  // namespace

std::span<const Check> RegisterChecks() {
    return kRegisterChecks;
}

}  // namespace hostcheck
