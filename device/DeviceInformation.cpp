// What the device tells the host about itself, and the one question that most operations ask the
// host first.

#include "device/FlashCorvane.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/Trace.h"

namespace {

std::string KibibyteText(std::uint32_t sizeBytes) {
    return ToDecimalText(sizeBytes >> 10) + "KB";
}

}  // namespace

void FlashCorvane::Initialize() {
    TRACE(Entry, "FlashCorvane::Initialize()");
    const std::string flashSize = KibibyteText(p_mFlashSize);
    p_mHost.SetSetting(Setting::DeviceInfoFlashSize, flashSize);
    TRACE(Entry, "FlashCorvane::Initialize(), Flash size = %s", flashSize.c_str());
    const std::string ramSize = KibibyteText(p_mRAMSize);
    p_mHost.SetSetting(Setting::DeviceInfoRAMSize, ramSize);
    TRACE(Entry, "FlashCorvane::Initialize(), RAM size = %s", ramSize.c_str());
    const std::string sectorSize = KibibyteText(p_mSectorSize);
    p_mHost.SetSetting(Setting::DeviceInfoSectorSize, sectorSize);
    TRACE(Entry, "FlashCorvane::Initialize(), Sector size = %s", sectorSize.c_str());
    p_mHost.SetSetting(Setting::DeviceInfoFamily, p_mFamily);
    TRACE(Entry, "FlashCorvane::Initialize(), Device Family = %s", p_mFamily.c_str());
    TRACE(Result, "FlashCorvane::Initialize()");
}

std::int32_t FlashCorvane::VerboseMode() const {
    return ParseInteger(p_mHost.GetSetting(Setting::FlashVerboseMode));
}
