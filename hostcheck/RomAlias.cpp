#include "hostcheck/RomAlias.h"

#include "device/RegisterMap.h"

namespace hostcheck {

namespace {

constexpr std::uint32_t kSettlingAfterRomMs = 10;

}  // namespace

// Which devices have one, and how long they take, is what the plug-in goes by.
void ClearRomAlias(const CheckedHost& host) {
    const std::uint32_t identification = host.ReadWord(Register::DeviceIdentification0);
    const std::uint32_t classField = identification >> 16 & 0xFF;
    const std::uint32_t majorRevision = identification >> 8 & 0xFF;
    if (classField < 3 && (classField != 1 || majorRevision == 0)) return;
    host.WriteWord(Register::RomControl, host.ReadWord(Register::RomControl));
    host.Sleep(kSettlingAfterRomMs);
}

}  // namespace hostcheck
