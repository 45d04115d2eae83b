// The start of a program load: the per-load state goes back to its beginning, and the target with
// it as far as the host's settings ask.

#include "device/FlashCorvane.h"
#include "device/RegisterMap.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/Trace.h"

namespace {

namespace ResetMode {
constexpr std::int32_t ResetWatchdogs = 1;
constexpr std::int32_t Checksum = 2;
constexpr std::int32_t KeepErased = 4;
}  // namespace ResetMode

void ResetWatchdogs(const HostAccess& host, DeviceClass deviceClass) {
    const bool newer = deviceClass > DeviceClass::Quen;
    const std::uint32_t address = newer ? Register::WatchdogReset : Register::SoftwareReset0;
    const std::uint32_t watchdogs = newer ? 0x3 : 0x10000008;

    host.WriteWord(address, host.ReadWord(address) | watchdogs);
    host.WriteWord(address, host.ReadWord(address) & ~watchdogs);
}

}  // namespace

// The state is reset before any setting is read, so that a bad setting cannot leave half a load
// behind.
void FlashCorvane::ResetSettings(std::int32_t mode) {
    TRACE(Entry, "FlashCorvane::ResetSettings(%d)", mode);
    if (mode != ResetMode::KeepErased) p_mFlashErased = false;
    p_mResetPending = true;
    p_mErasedSectors.clear();

    const bool resetTarget = ParseBoolean(p_mHost.GetSetting(Setting::FlashResetSetting));
    if (resetTarget && mode != ResetMode::ResetWatchdogs) SystemResetAndHalt();

    if (mode == ResetMode::Checksum) {
        if (ParseBoolean(p_mHost.GetSetting(Setting::FlashProgramCRCOption))) {
            CalculateChecksumByAddress(0, p_mFlashSize - 1);
        }
    } else if (mode == ResetMode::ResetWatchdogs) {
        ResetWatchdogs(p_mHost, p_mClassRev);
        p_mHost.SetSetting(Setting::FlashChecksumValue, "--");
    }
    TRACE(Result, "FlashCorvane::ResetSettings()");
}
