#include "hostcheck/RomAlias.h"

#include "device/RegisterMap.h"

namespace hostcheck {

namespace {

constexpr std::uint32_t kSettlingAfterRomMs = 10;

// Which devices have one is what the plug-in goes by.
bool HasRom(const CheckedHost& host) {
    const std::uint32_t identification = host.ReadWord(Register::DeviceIdentification0);
    const std::uint32_t classField = identification >> 16 & 0xFF;
    const std::uint32_t majorRevision = identification >> 8 & 0xFF;
    return classField >= 3 || (classField == 1 && majorRevision != 0);
}

}  // namespace

bool RomLiesOverFlash(const CheckedHost& host) {
    return HasRom(host) && (host.ReadWord(Register::RomControl) & 1) != 0;
}

void ClearRomAlias(const CheckedHost& host) {
    if (!HasRom(host)) return;
    host.WriteWord(Register::RomControl, host.ReadWord(Register::RomControl));
    host.Sleep(kSettlingAfterRomMs);
}

}  // namespace hostcheck
