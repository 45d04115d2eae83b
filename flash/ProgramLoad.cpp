// One section of a program load: initialise, erase as the host's settings say, check, program.

#include "device/FlashCorvane.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/Trace.h"

namespace {

// After an erase the controller settles; after programming the loader finishes its last chunk.
constexpr std::uint32_t kSettlingMs = 50;

}  // namespace

bool FlashCorvane::WriteDataToFlash(const std::uint8_t* data, std::uint32_t address,
                                    std::uint32_t length, std::int16_t page) {
    TRACE(Entry, "FlashCorvane::WriteDataToFlash(%p,0x%08X,0x%08X,%d)",
          static_cast<const void*>(data), address, length, page);
    if (!InitializeDevice()) {
        p_mHost.ShowErrorText("Flash Programmer: Error initializing device.");
        TRACE(Result, "FlashCorvane::WriteDataToFlash() failed");
        return false;
    }
    p_mResetPending = false;

    const std::uint32_t last = address + length - 1;
    if (!p_mFlashErased) {
        EraseForSection(address, last);
        p_mHost.Sleep(kSettlingMs);
    }
    const bool checkFirst = ParseBoolean(p_mHost.GetSetting(Setting::FlashProgramBlankCheckOption));
    if (checkFirst && !BlankCheckByAddress(address, last)) {
        p_mHost.ShowErrorText("Flash Programmer: Blank Check failed during program load.");
        TRACE(Result, "FlashCorvane::WriteDataToFlash() failed");
        return false;
    }

    const bool programmed = Program(data, address, length, page);
    p_mHost.Sleep(kSettlingMs);
    TRACE(Result, "FlashCorvane::WriteDataToFlash() = %u", static_cast<unsigned>(programmed));
    return programmed;
}

// A failed erase has been shown and does not end the load: programming tells whether it mattered.
void FlashCorvane::EraseForSection(std::uint32_t address, std::uint32_t last) {
    const std::string option = p_mHost.GetSetting(Setting::FlashProgramOption);
    if (option == Choice::NecessaryPagesOnly) {
        PageErase(address, last);
    } else if (option == Choice::DoNotErase) {
        p_mFlashErased = true;
    } else if (option == Choice::UseEraseOptions) {
        p_mFlashErased = Erase();
    }
}
