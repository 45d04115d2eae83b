// Erasing flash: the whole of it at once, or the sectors that cover an address range.

#include <algorithm>
#include <exception>

#include "device/FlashCorvane.h"
#include "device/RegisterMap.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/Trace.h"

namespace {

// The flash address register must point into the upper bank when a larger device is erased whole.
constexpr std::uint32_t kUpperBank = 0x20000;

constexpr int kMassErasePolls = 500;
constexpr std::uint32_t kMassErasePauseMs = 10;
constexpr int kSectorErasePolls = 200;
constexpr std::uint32_t kSectorErasePauseMs = 5;

// Mesk devices erase whole only when the block registers beyond the end of flash are clear. Where
// the flash ends inside a register's blocks, the lower half of block register 0 is written there.
struct FlashBlockRow {
    std::uint32_t flashSize;
    std::uint32_t lowestCleared;  ///< cleared from block register 3 down to this one
    std::uint32_t halved;         ///< receives the lower half; 0 for none
};

constexpr FlashBlockRow kFlashBlockRows[] = {
    {0x08000, Register::FlashBlock1, Register::FlashBlock0},
    {0x10000, Register::FlashBlock1, 0},
    {0x18000, Register::FlashBlock2, Register::FlashBlock1},
    {0x20000, Register::FlashBlock2, 0},
};

bool PrepareFlashBlocks(const HostAccess& host, std::uint32_t flashSize) {
    const auto row = std::ranges::find(kFlashBlockRows, flashSize, &FlashBlockRow::flashSize);
    if (row == std::end(kFlashBlockRows)) return false;

    const auto writeAndPause = [&](std::uint32_t address, std::uint32_t value) {
        host.WriteWord(address, value);
        host.Sleep(kMassErasePauseMs);
    };
    for (std::uint32_t address = Register::FlashBlock3; address >= row->lowestCleared;
         address -= 4) {
        writeAndPause(address, 0);
    }
    if (row->halved != 0) {
        writeAndPause(row->halved, host.ReadWord(Register::FlashBlock0) & 0xFFFF);
    }
    return true;
}

bool EraseFinished(const HostAccess& host, std::uint32_t command, int polls,
                   std::uint32_t pollIntervalMs) {
    for (int poll = 0; poll < polls; ++poll) {
        if ((host.ReadWord(Register::FlashCommand) & command) == 0) return true;
        host.Sleep(pollIntervalMs);
    }
    return false;
}

}  // namespace

bool FlashCorvane::Erase() {
    TRACE(Entry, "FlashCorvane::Erase()");
    ProgressHandle progress = p_mHost.OpenProgress("Erasing Flash.");
    bool erased = false;
    try {
        erased = EraseAsSelected();
        progress.CloseProgress();
    } catch (const std::exception& error) {
        p_mHost.ShowErrorText(
            std::string("Flash Programmer: Current erase option is not valid; please try changing "
                        "option to erase Entire Flash or By Address Range. ") +
            error.what());
        progress.CloseQuietly();
        TRACE(Result, "FlashCorvane::Erase() = false");
        return false;
    }
    TRACE(Result, "FlashCorvane::Erase() = %s", erased ? "true" : "false");
    return erased;
}

bool FlashCorvane::EraseAsSelected() {
    const std::string type = p_mHost.GetSetting(Setting::FlashEraseType);
    if (type == Choice::EntireFlash) {
        p_mHost.WriteWord(Register::FlashAddress, 0);
        if (VerboseMode() != 0) {
            p_mHost.ShowMessageText("Performing Mass Erase on Flash memory");
        }
        if (p_mFlashSize > kUpperBank) p_mHost.WriteWord(Register::FlashAddress, kUpperBank);
        return MassErase();
    }
    if (type == Choice::ByAddressRange) {
        const std::uint32_t end = ParseHex(p_mHost.GetSetting(Setting::FlashEraseEndAddr));
        const std::uint32_t start = ParseHex(p_mHost.GetSetting(Setting::FlashEraseStartAddr));
        return PageErase(start, end);
    }
    return false;
}

bool FlashCorvane::MassErase() {
    TRACE(Entry, "FlashCorvane::MassErase()");
    p_mHost.HaltTarget();
    const bool mesk = p_mClassRev == DeviceClass::MeskRevA || p_mClassRev == DeviceClass::MeskRevB;
    if (mesk && !PrepareFlashBlocks(p_mHost, p_mFlashSize)) {
        TRACE(Result, "FlashCorvane::MassErase() = false, p_mFlashSize %u unsupported.",
              p_mFlashSize);
        return false;
    }

    p_mHost.WriteWord(Register::FlashCommand, KeyedCommand(FlashCommandBit::EraseAll));
    p_mHost.Sleep(kMassErasePauseMs);
    if (!EraseFinished(p_mHost, FlashCommandBit::EraseAll, kMassErasePolls, kMassErasePauseMs)) {
        p_mHost.ShowErrorText("Flash Programmer: Erasing all of the flash contents failed!");
        TRACE(Result, "FlashCorvane::MassErase() = false");
        return false;
    }
    p_mHost.ResetTarget(false);
    ROMAliasClear();
    TRACE(Result, "FlashCorvane::MassErase() = true");
    return true;
}

bool FlashCorvane::PageErase(std::uint32_t start, std::uint32_t end) {
    TRACE(Entry, "FlashCorvane::PageErase(0x%08X, 0x%08X)", start, end);
    p_mHost.HaltTarget();
    if (start >= p_mFlashSize || end >= p_mFlashSize) {
        p_mHost.ShowErrorText("Flash Programmer: Invalid Address Range for erase operation!");
        TRACE(Result, "FlashCorvane::PageErase() = false");
        return false;
    }

    const std::uint32_t command = KeyedCommand(FlashCommandBit::EraseSector);
    // A range that ends before it starts is an empty one, even when both ends share a sector.
    const bool empty = start > end;
    if (!empty && !EraseSectors(start / p_mSectorSize, end / p_mSectorSize, command)) {
        p_mHost.ShowErrorText("Flash Programmer: Erasing flash contents timed out!");
        TRACE(Result, "FlashCorvane::PageErase() = false");
        return false;
    }
    p_mHost.ResetTarget(false);
    ROMAliasClear();
    TRACE(Result, "FlashCorvane::PageErase() = true");
    return true;
}

// The erased sectors are kept in ascending order, and walked along with the range: no sector is
// searched for, and in a load whose sections ascend each is appended.
bool FlashCorvane::EraseSectors(std::uint32_t first, std::uint32_t last,
                                std::uint32_t keyedCommand) {
    auto erased = std::ranges::lower_bound(p_mErasedSectors, first);
    for (std::uint32_t sector = first; sector <= last; ++sector, ++erased) {
        if (erased != p_mErasedSectors.end() && *erased == sector) continue;
        if (!EraseSector(sector, keyedCommand)) return false;
        erased = p_mErasedSectors.insert(erased, sector);
    }
    return true;
}

bool FlashCorvane::EraseSector(std::uint32_t sector, std::uint32_t keyedCommand) {
    const std::uint32_t address = sector * p_mSectorSize;
    if (VerboseMode() != 0) {
        const std::string text = "Erasing Flash Page @ address 0x" + ToHexText(address) +
                                 " of size 0x" + ToHexText(p_mSectorSize);
        TRACE_TEXT(Information, text);
        p_mHost.ShowMessageText(text);
    }
    p_mHost.Sleep(kSectorErasePauseMs);
    p_mHost.WriteWord(Register::FlashAddress, address);
    p_mHost.Sleep(kSectorErasePauseMs);
    p_mHost.WriteWord(Register::FlashCommand, keyedCommand);
    p_mHost.Sleep(kSectorErasePauseMs);
    return EraseFinished(p_mHost, FlashCommandBit::EraseSector, kSectorErasePolls,
                         kSectorErasePauseMs);
}
