// What the verifying operations share: the range that the user's settings select, and reading a
// range in chunks under a progress display.

#include "verify/Ranges.h"

#include <algorithm>
#include <stdexcept>

#include "device/FlashCorvane.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"

namespace {

// What one host read may ask for, a little short of 32 KiB. The buffer has room for four times as
// much: a host that rounds a read up to its own transfer size must not write past it.
constexpr std::uint32_t kChunkSize = 32752;
constexpr std::size_t kReadBufferSize = std::size_t{4} * kChunkSize;
constexpr std::int16_t kFlashPage = 0;

}  // namespace

bool FlashCorvane::RangeWithinFlash(std::uint32_t start, std::uint32_t end) const {
    return end >= start && end < p_mFlashSize && start < p_mFlashSize;
}

bool FlashCorvane::RunOnSelectedRange(const std::string& operationName,
                                      const std::string& selectionKey, const std::string& startKey,
                                      const std::string& endKey, RangeOperation operation) {
    const std::string selection = p_mHost.GetSetting(selectionKey);
    if (selection == Choice::EntireFlash) return (this->*operation)(0, p_mFlashSize - 1);
    if (selection == Choice::ByAddressRange) {
        const std::uint32_t start = ParseHex(p_mHost.GetSetting(startKey));
        const std::uint32_t end = ParseHex(p_mHost.GetSetting(endKey));
        return (this->*operation)(start, end);
    }
    throw std::runtime_error(operationName + " range selection not set.");
}

bool ReadRangeInChunks(const HostAccess& host, const ProgressHandle& progress,
                       const std::string& text, std::uint32_t start, std::uint32_t end,
                       const ChunkConsumer& consumer) {
    std::vector<std::uint8_t> buffer(kReadBufferSize);
    const std::uint32_t total = end - start + 1;
    std::uint32_t address = start;
    for (std::uint32_t remaining = total; remaining > 0;) {
        // In 32 bits, as hosts know it: above 40 MiB the product wraps and the percentage jumps.
        const std::uint32_t percent = (total - remaining) * 100 / total;
        progress.UpdateProgress(percent, text);
        const std::uint32_t count = std::min(remaining, kChunkSize);
        host.ReadBytes(buffer.data(), count, address, kFlashPage);
        if (!consumer(buffer, count, address)) return false;
        address += count;
        remaining -= count;
    }
    return true;
}
