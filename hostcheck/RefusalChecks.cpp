// Accesses that have to fail, and what comes after them. The family has nothing at the address:
// flash and ROM end below it, RAM begins above.

#include "hostcheck/Checks.h"
#include "hostcheck/RamWindow.h"

namespace hostcheck {

namespace {

constexpr std::uint32_t kUnmapped = 0x10000000;

template <typename Access>
std::string RefusedWithAText(CheckedHost& host, Access access) {
    const auto error = host.AskForAWhile(access);
    if (!error) throw Breach("null");
    return "it says " + Quoted(*error);
}

std::string RefusesUnmappedReads(CheckedHost& host) {
    Bytes buffer(4096);
    return RefusedWithAText(host, [&](IFlashHost& h) {
        return h.ReadMemory(buffer.data(), 16, kUnmapped, kGeneralPage, 1);
    });
}

std::string RefusesUnmappedWrites(CheckedHost& host) {
    const Bytes buffer(4096);
    return RefusedWithAText(host, [&](IFlashHost& h) {
        return h.WriteMemory(buffer.data(), 16, kUnmapped, kGeneralPage, 1);
    });
}

std::string GoesOnAfterAFailure(CheckedHost& host) {
    host.ReadWord(RamWindow::kStart);
    return "";
}

constexpr Check kRefusalChecks[] = {
    {Stage::Initialize, "ReadMemory", "an error text at 0x10000000, where nothing is",
     RefusesUnmappedReads},
    {Stage::Initialize, "WriteMemory", "an error text at 0x10000000, where nothing is",
     RefusesUnmappedWrites},
    {Stage::Initialize, "ReadMemory", "success after an access that failed", GoesOnAfterAFailure},
};

}  // namespace

std::span<const Check> RefusalChecks() {
    return kRefusalChecks;
}

}  // namespace hostcheck
