// Proving that flash is erased: every byte of a range reads 0xFF.

#include <algorithm>
#include <cstring>
#include <exception>

#include "device/FlashCorvane.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/Trace.h"
#include "verify/Ranges.h"

namespace {

constexpr std::uint8_t kErasedByte = 0xFF;

// The offset of the first byte that is not erased, or count. A chunk whose first byte is erased
// and that equals itself one byte further on is erased throughout, which memcmp tells fastest.
std::uint32_t FirstNotErased(const std::uint8_t* bytes, std::uint32_t count) {
    if (bytes[0] == kErasedByte && std::memcmp(bytes, bytes + 1, count - 1) == 0) return count;
    const auto* found =
        std::find_if(bytes, bytes + count, [](std::uint8_t byte) { return byte != kErasedByte; });
    return static_cast<std::uint32_t>(found - bytes);
}

}  // namespace

bool FlashCorvane::BlankCheck() {
    TRACE(Entry, "FlashCorvane::BlankCheck()");
    try {
        const bool blank = RunOnSelectedRange(
            "BlankCheck", Setting::FlashBlankCheckSelection, Setting::FlashBlankCheckStartAddr,
            Setting::FlashBlankCheckEndAddr, &FlashCorvane::BlankCheckByAddress);
        TRACE(Result, "FlashCorvane::BlankCheck() = %u", static_cast<unsigned>(blank));
        return blank;
    } catch (const std::exception& error) {
        p_mHost.ShowErrorText("Flash Programmer: Missing Blank Check option. Operation cancelled.");
        TRACE(Result, "FlashCorvane::BlankCheck() = false %s", error.what());
        return false;
    }
}

bool FlashCorvane::BlankCheckByAddress(std::uint32_t start, std::uint32_t end) {
    TRACE(Entry, "FlashCorvane::BlankCheckByAddress(0x%08X, 0x%08X)", start, end);
    if (!RangeWithinFlash(start, end)) {
        p_mHost.ShowErrorText(
            "Flash Programmer: Invalid range given for Blank Check. Operation cancelled.");
        TRACE(Result, "FlashCorvane::BlankCheckByAddress() = false");
        return false;
    }
    // Flash is programmed in words, so whole words are checked.
    const std::uint32_t alignedStart = start & ~3u;
    const std::uint32_t alignedEnd = end | 3u;
    if (VerboseMode() != 0) {
        p_mHost.ShowMessageText(
            "Performing Blank Check on the following (aligned) memory range: 0x" +
            ToHexText(alignedStart) + " - 0x" + ToHexText(alignedEnd));
    }

    ProgressHandle progress = p_mHost.OpenProgress("Performing Blank Check");
    bool blank = false;
    try {
        blank = ReadRangeInChunks(
            p_mHost, progress, "Checking...", alignedStart, alignedEnd,
            [this](const std::vector<std::uint8_t>& buffer, std::uint32_t count,
                   std::uint32_t address) { return ChunkIsBlank(buffer, count, address); });
    } catch (const std::exception& error) {
        p_mHost.ShowErrorText(
            "Flash Programmer: Error during Blank Check; memory allocation error.");
        progress.CloseProgress();
        TRACE(Result, "FlashCorvane::BlankCheckByAddress() = false %s", error.what());
        return false;
    }
    progress.CloseProgress();
    if (blank) TRACE(Result, "FlashCorvane::BlankCheckByAddress() = true");
    return blank;
}

// Shows the first byte that is not erased, and traces the result that this makes of the check.
bool FlashCorvane::ChunkIsBlank(const std::vector<std::uint8_t>& buffer, std::uint32_t count,
                                std::uint32_t address) {
    const std::uint32_t offset = FirstNotErased(buffer.data(), count);
    if (offset == count) return true;
    p_mHost.ShowErrorText("Flash Programmer: Error during Blank Check @ address 0x" +
                          ToHexText(address + offset) + "; expected 0xFF, actual 0x" +
                          ToHexText(buffer[offset]));
    TRACE(Result, "FlashCorvane::BlankCheckByAddress() = false");
    return false;
}
