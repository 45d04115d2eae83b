// What the verifying operations share: the range that the user's settings select, and reading a
// range in chunks under a progress display.

#include <algorithm>
#include <stdexcept>

#include "device/FlashCorvane.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/ErrorText.h"

namespace {

// What one host read may ask for, a little short of 32 KiB, and the buffer that hosts expect it in.
constexpr std::uint32_t kChunkSize = 32752;
constexpr std::size_t kReadBufferSize = 131008;
constexpr std::int16_t kFlashPage = 0;

}  // namespace

bool FlashCorvane::RangeWithinFlash(std::uint32_t start, std::uint32_t end) const {
    return end >= start && end < p_mFlashSize && start < p_mFlashSize;
}

bool FlashCorvane::RunOnSelectedRange(const std::string& operationName,
                                      const std::string& selectionKey, const std::string& startKey,
                                      const std::string& endKey, const RangeOperation& operation) {
    const std::string selection = Host().GetSetting(selectionKey);
    if (selection == Choice::EntireFlash) return operation(0, p_mFlashSize - 1);
    if (selection == Choice::ByAddressRange) {
        const std::uint32_t start = ParseHex(Host().GetSetting(startKey));
        const std::uint32_t end = ParseHex(Host().GetSetting(endKey));
        return operation(start, end);
    }
    throw std::runtime_error(operationName + " range selection not set.");
}

bool FlashCorvane::ReadRangeInChunks(ProgressHandle& /*progress*/, const std::string& text,
                                     std::uint32_t start, std::uint32_t end,
                                     const ChunkConsumer& consumer) {
    std::vector<std::uint8_t> buffer(kReadBufferSize);
    const std::uint32_t total = end - start + 1;
    std::uint32_t address = start;
    for (std::uint32_t remaining = total; remaining > 0;) {
        // In 32 bits, as hosts know it: above 40 MiB the product wraps and the percentage jumps.
        const std::uint32_t percent = (total - remaining) * 100 / total;
        ThrowOnError(p_mHost->UpdateProgress(percent, text.c_str()));
        const std::uint32_t count = std::min(remaining, kChunkSize);
        ThrowOnError(p_mHost->ReadMemory(buffer.data(), count, address, kFlashPage, 1));
        if (!consumer(buffer, count, address)) return false;
        address += count;
        remaining -= count;
    }
    return true;
}
