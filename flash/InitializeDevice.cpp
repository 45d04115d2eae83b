// Bringing the device into a state in which its flash controller can be driven.

#include <exception>

#include "device/FlashCorvane.h"
#include "device/RegisterMap.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/Trace.h"

namespace {

// A host without a crystal setting, or a device that refuses it, still gets a timing that is safe.
void SetFlashTiming(const HostAccess& host) {
    try {
        const std::uint32_t crystal = ParseHex(host.GetSetting(Setting::FlashCrystalFreq));
        host.WriteWord(Register::FlashTiming, crystal - 1);
    } catch (const std::exception&) {
        host.WriteWord(Register::FlashTiming, 7);
    }
}

// Only the first silicon of the class needs it.
void FixUpOrrinClock(const HostAccess& host) {
    if (host.ReadWord(Register::DeviceIdentification0) != 0x10040101) return;
    const std::uint32_t clock2 = host.ReadWord(Register::ClockConfiguration2);
    host.WriteWord(Register::ClockConfiguration2, clock2 & 0x7FFFFFFF);
    host.WriteWord(Register::ClockConfiguration, 0x078E3AD1);
    host.Sleep(20);
}

void FixUpQuenController(const HostAccess& host) {
    host.WriteWord(Register::QuenUnlock, 3);
    host.WriteWord(Register::QuenFixUp, 0);
    host.WriteWord(Register::QuenUnlock, 0);
}

}  // namespace

bool FlashCorvane::InitializeDevice() {
    TRACE(Entry, "FlashCorvane::InitializeDevice()");
    switch (p_mClassRev) {
        case DeviceClass::Ravik:
        case DeviceClass::TolvaRevA:
        case DeviceClass::TolvaRevB:
        case DeviceClass::MeskRevA:
        case DeviceClass::MeskRevB:
            SetUpClockAndTiming();
            break;
        case DeviceClass::Orrin:
            FixUpOrrinClock(p_mHost);
            break;
        case DeviceClass::Quen:
            FixUpQuenController(p_mHost);
            break;
        case DeviceClass::Dorna:
            break;
        default:
            TRACE(Result, "FlashCorvane::InitializeDevice() p_mClassRev %d not recognized.",
                  static_cast<int>(p_mClassRev));
            break;
    }
    TRACE(Result, "FlashCorvane::InitializeDevice()");
    return true;
}

void FlashCorvane::SetUpClockAndTiming() {
    const bool resetTarget = ParseBoolean(p_mHost.GetSetting(Setting::FlashResetSetting));
    if (resetTarget && p_mResetPending) SystemResetAndHalt();

    SetFlashTiming(p_mHost);
    p_mHost.HaltTarget();

    // Every write starts from this one reading: the register must not be read again while the
    // clock is being switched. The last two settings are written twice to let them settle.
    const std::uint32_t clock = p_mHost.ReadWord(Register::ClockConfiguration);
    p_mHost.Sleep(20);
    p_mHost.WriteWord(Register::ClockConfiguration, (clock & ~0x00400000u) | 0x00000800);
    p_mHost.WriteWord(Register::ClockSetup, 0x00000040);
    for (int i = 0; i < 2; ++i) {
        p_mHost.WriteWord(Register::ClockConfiguration, (clock & ~0x00400073u) | 0x00003B80);
    }
    for (int i = 0; i < 2; ++i) {
        p_mHost.WriteWord(Register::ClockConfiguration, (clock & ~0x005E0073u) | 0x07803B82);
    }
    p_mHost.Sleep(20);
}

bool FlashCorvane::SystemResetAndHalt() {
    TRACE(Entry, "FlashCorvane::SystemResetAndHalt()");
    p_mHost.HaltTarget();
    p_mHost.ResetTarget(p_mClassRev != DeviceClass::Ravik);
    for (const std::uint32_t value : {0xFFFFFFFFu, 0u}) {
        p_mHost.Sleep(5);
        p_mHost.WriteWord(Register::SoftwareReset0, value);
        p_mHost.WriteWord(Register::SoftwareReset1, value);
        p_mHost.WriteWord(Register::SoftwareReset2, value);
    }
    ROMAliasClear();
    TRACE(Result, "FlashCorvane::SystemResetAndHalt() = true");
    return true;
}

bool FlashCorvane::ROMAliasClear() {
    TRACE(Entry, "FlashCorvane::ROMAliasClear()");
    const std::uint32_t identification = p_mHost.ReadWord(Register::DeviceIdentification0);
    const std::uint32_t classField = identification & 0x00FF0000;
    const std::uint32_t majorRevision = identification & 0x0000FF00;
    const bool hasAlias =
        classField >= 0x00030000 || (classField == 0x00010000 && majorRevision >= 0x00000100);
    if (hasAlias) {
        // The bit that holds the alias is cleared by writing what was read.
        p_mHost.WriteWord(Register::RomControl, p_mHost.ReadWord(Register::RomControl));
        p_mHost.Sleep(10);
    }
    TRACE(Result, "FlashCorvane::ROMAliasClear() = true");
    return true;
}
