// The target's core without the loader: halt and reset.

#include "device/RegisterMap.h"
#include "hostcheck/Checks.h"
#include "hostcheck/Patterns.h"
#include "hostcheck/RamWindow.h"

namespace hostcheck {

namespace {

constexpr std::uint32_t kAPauseMs = 50;

std::string Halts(CheckedHost& host) {
    host.Halt();
    return "";
}

std::string Resets(CheckedHost& host) {
    for (const bool flag : {true, false})
        host.Reset(flag);
    return "";
}

// 0 is what it holds after power-up, too.
std::string ResetsRegisters(CheckedHost& host) {
    for (const bool flag : {true, false}) {
        const std::uint32_t written = 0x00004000;
        host.WriteWord(Register::FlashAddress, written);
        host.Reset(flag);
        const std::uint32_t came = host.ReadWord(Register::FlashAddress);
        if (came == written)
            throw Breach(HexWord(came) + ", as it was written before, when the flag is " +
                         (flag ? "true" : "false") +
                         ": no reset, or a register that comes from a cache");
    }
    return "";
}

// A program that runs writes its variables sooner or later. Nothing can be said of one that
// doesn't.
std::string StaysHalted(CheckedHost& host) {
    const RamWindow window(host, RamWindow::kBytesMax);
    for (const bool flag : {true, false}) {
        host.Reset(flag);
        const Bytes bytes = Pattern(RamWindow::kBytesMax, flag ? 1 : 2);
        WriteAll(host, RamWindow::kStart, bytes);
        host.Sleep(kAPauseMs);
        RequireEqual(host.Read(RamWindow::kStart, bytes.size(), 1), bytes,
                     "50 ms after it was written");
    }
    return "";
}

std::string ReachesRamOnThatPage(CheckedHost& host) {
    const RamWindow window(host, 16);
    const Bytes bytes{0xC0, 0x1D, 0xBE, 0xEF};
    host.Write(RamWindow::kStart, bytes, 1, host.page);
    for (const std::int16_t page : {host.page, kGeneralPage})
        RequireEqual(host.Read(RamWindow::kStart, bytes.size(), 1, page), bytes,
                     "written on page " + std::to_string(host.page) + " and read on page " +
                         std::to_string(page));
    return "";
}

constexpr Check kCoreChecks[] = {
    {Stage::Creation, "HaltTarget", "null", Halts},
    {Stage::Creation, "HaltTarget", "null for a target that is halted already", Halts},
    {Stage::LoadBegins, "ResetTarget", "null for either flag", Resets},
    {Stage::LoadBegins, "ResetTarget", "registers that are reset", ResetsRegisters},
    {Stage::LoadBegins, "ResetTarget", "a target that is left halted, so that RAM stays",
     StaysHalted},
    {Stage::LoadBegins, "HaltTarget", "null after a reset", Halts},
    {Stage::LoadBegins, "WriteMemory", "RAM on the page given to WriteDataToFlash",
     ReachesRamOnThatPage},
};

}  // namespace

std::span<const Check> CoreChecks() {
    return kCoreChecks;
}

}  // namespace hostcheck
