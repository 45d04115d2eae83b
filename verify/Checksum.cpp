// The CRC-32 of a flash range (IEEE 802.3: reflected, initial value and final XOR all ones), read
// back from the target, shown to the user and published to the host.

#include <stdexcept>

#include "device/FlashCorvane.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/Trace.h"
#include "verify/Ranges.h"

namespace {

constexpr std::uint32_t kPolynomial = 0x04C11DB7;

constexpr std::uint32_t ReverseBits(std::uint32_t value) {
    std::uint32_t reversed = 0;
    for (int bit = 0; bit < 32; ++bit) {
        reversed = reversed << 1 | (value >> bit & 1);
    }
    return reversed;
}

}  // namespace

// Only runtime errors are the user's business here: a setting that is missing or malformed is the
// host's, and goes back to it.
bool FlashCorvane::CalculateChecksum() {
    TRACE(Entry, "FlashCorvane::CalculateChecksum()");
    try {
        return RunOnSelectedRange("CalculateChecksum", Setting::FlashChecksumSelection,
                                  Setting::FlashChecksumStartAddr, Setting::FlashChecksumEndAddr,
                                  &FlashCorvane::CalculateChecksumByAddress);
    } catch (const std::runtime_error& error) {
        p_mHost.ShowErrorText("Flash Programmer: Missing CRC option. Operation cancelled.");
        TRACE(Result, "FlashCorvane::CalculateChecksum() = false %s", error.what());
        return false;
    }
}

bool FlashCorvane::CalculateChecksumByAddress(std::uint32_t start, std::uint32_t end) {
    TRACE(Entry, "FlashCorvane::CalculateChecksumByAddress(0x%08X, 0x%08X)", start, end);
    if (!RangeWithinFlash(start, end)) {
        p_mHost.ShowErrorText(
            "Flash Programmer: Invalid range given for CRC calculation. Operation cancelled.");
        TRACE(Result, "FlashCorvane::CalculateChecksumByAddress() = false");
        return false;
    }
    if (VerboseMode() != 0) {
        p_mHost.ShowMessageText("The following range was selected: 0x" + ToHexText(start) +
                                " - 0x" + ToHexText(end));
    }
    InitCRC32LUT();
    std::uint32_t crc = 0xFFFFFFFF;
    ProgressHandle progress = p_mHost.OpenProgress("CRC Calculation");
    try {
        ReadRangeInChunks(p_mHost, progress, "Calculating...", start, end,
                          [this, &crc](const std::vector<std::uint8_t>& buffer, std::uint32_t count,
                                       std::uint32_t /*address*/) {
                              UpdateCRC32(crc, buffer.data(), count);
                              return true;
                          });
    } catch (const std::runtime_error& error) {
        p_mHost.ShowErrorText("Flash Programmer: Error calculating CRC; memory allocation error.");
        progress.CloseProgress();
        TRACE(Result, "FlashCorvane::CalculateChecksumByAddress() = false %s", error.what());
        return false;
    }
    // Published first, so that whoever reacts to the message finds the value.
    const std::string text = ToHexText(~crc);
    p_mHost.SetSetting(Setting::FlashChecksumValue, text);
    p_mHost.ShowMessageText("The calculated CRC-32 value: 0x" + text);
    progress.CloseProgress();
    TRACE(Result, "FlashCorvane::CalculateChecksumByAddress() = true");
    return true;
}

void FlashCorvane::InitCRC32LUT() {
    TRACE(Entry, "FlashCorvane::InitCRC32LUT(0x%08X)", kPolynomial);
    constexpr std::uint32_t reversed = ReverseBits(kPolynomial);
    for (std::uint32_t i = 0; i < p_mCRC32LUT.size(); ++i) {
        std::uint32_t entry = i;
        for (int bit = 0; bit < 8; ++bit) {
            entry = (entry & 1) != 0 ? entry >> 1 ^ reversed : entry >> 1;
        }
        p_mCRC32LUT[i] = entry;
    }
    TRACE(Result, "FlashCorvane::InitCRC32LUT()");
}

void FlashCorvane::UpdateCRC32(std::uint32_t& crc, const std::uint8_t* bytes,
                               std::uint32_t count) const {
    std::uint32_t running = crc;
    for (std::uint32_t i = 0; i < count; ++i) {
        running = p_mCRC32LUT[(running ^ bytes[i]) & 0xFF] ^ running >> 8;
    }
    crc = running;
}
