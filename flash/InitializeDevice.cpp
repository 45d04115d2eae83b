// Bringing the device into a state in which its flash controller can be driven.

#include <exception>

#include "device/DeviceClass.h"
#include "device/FlashCorvane.h"
#include "device/RegisterMap.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/ErrorText.h"
#include "plugin/Trace.h"

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
            FixUpOrrinClock();
            break;
        case DeviceClass::Quen:
            FixUpQuenController();
            break;
        case DeviceClass::Dorna:
            break;
        default:
            TRACE(Result, "FlashCorvane::InitializeDevice() p_mClassRev %d not recognized.",
                  p_mClassRev);
            break;
    }
    TRACE(Result, "FlashCorvane::InitializeDevice()");
    return true;
}

void FlashCorvane::SetUpClockAndTiming() {
    const bool resetTarget = ParseBoolean(Host().GetSetting(Setting::FlashResetSetting));
    if (resetTarget && p_mResetPending) SystemResetAndHalt();

    SetFlashTiming();
    ThrowOnError(p_mHost->HaltTarget());

    // Every write starts from this one reading: the register must not be read again while the
    // clock is being switched. The last two settings are written twice to let them settle.
    const std::uint32_t clock = Host().ReadWord(Register::ClockConfiguration);
    ThrowOnError(p_mHost->Sleep(20));
    Host().WriteWord(Register::ClockConfiguration, (clock & ~0x00400000u) | 0x00000800);
    Host().WriteWord(Register::ClockSetup, 0x00000040);
    for (int i = 0; i < 2; ++i) {
        Host().WriteWord(Register::ClockConfiguration, (clock & ~0x00400073u) | 0x00003B80);
    }
    for (int i = 0; i < 2; ++i) {
        Host().WriteWord(Register::ClockConfiguration, (clock & ~0x005E0073u) | 0x07803B82);
    }
    ThrowOnError(p_mHost->Sleep(20));
}

// A host without a crystal setting, or a device that refuses it, still gets a timing that is safe.
void FlashCorvane::SetFlashTiming() {
    try {
        const std::uint32_t crystal = ParseHex(Host().GetSetting(Setting::FlashCrystalFreq));
        Host().WriteWord(Register::FlashTiming, crystal - 1);
    } catch (const std::exception&) {
        Host().WriteWord(Register::FlashTiming, 7);
    }
}

// Only the first silicon of the class needs it.
void FlashCorvane::FixUpOrrinClock() {
    if (Host().ReadWord(Register::DeviceIdentification0) != 0x10040101) return;
    const std::uint32_t clock2 = Host().ReadWord(Register::ClockConfiguration2);
    Host().WriteWord(Register::ClockConfiguration2, clock2 & 0x7FFFFFFF);
    Host().WriteWord(Register::ClockConfiguration, 0x078E3AD1);
    ThrowOnError(p_mHost->Sleep(20));
}

void FlashCorvane::FixUpQuenController() {
    Host().WriteWord(Register::QuenUnlock, 3);
    Host().WriteWord(Register::QuenFixUp, 0);
    Host().WriteWord(Register::QuenUnlock, 0);
}

bool FlashCorvane::SystemResetAndHalt() {
    TRACE(Entry, "FlashCorvane::SystemResetAndHalt()");
    ThrowOnError(p_mHost->HaltTarget());
    ThrowOnError(p_mHost->ResetTarget(p_mClassRev != DeviceClass::Ravik));
    for (const std::uint32_t value : {0xFFFFFFFFu, 0u}) {
        ThrowOnError(p_mHost->Sleep(5));
        Host().WriteWord(Register::SoftwareReset0, value);
        Host().WriteWord(Register::SoftwareReset1, value);
        Host().WriteWord(Register::SoftwareReset2, value);
    }
    ROMAliasClear();
    TRACE(Result, "FlashCorvane::SystemResetAndHalt() = true");
    return true;
}

bool FlashCorvane::ROMAliasClear() {
    TRACE(Entry, "FlashCorvane::ROMAliasClear()");
    const std::uint32_t identification = Host().ReadWord(Register::DeviceIdentification0);
    const std::uint32_t classField = identification & 0x00FF0000;
    const std::uint32_t majorRevision = identification & 0x0000FF00;
    const bool hasAlias =
        classField >= 0x00030000 || (classField == 0x00010000 && majorRevision >= 0x00000100);
    if (hasAlias) {
        // The bit that holds the alias is cleared by writing what was read.
        Host().WriteWord(Register::RomControl, Host().ReadWord(Register::RomControl));
        ThrowOnError(p_mHost->Sleep(10));
    }
    TRACE(Result, "FlashCorvane::ROMAliasClear() = true");
    return true;
}
