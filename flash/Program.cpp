// Programming a byte image through the flash loader, a small program that runs on the target and
// takes its work from two RAM buffers in turn.

#include <algorithm>
#include <array>
#include <chrono>
#include <exception>
#include <limits>
#include <stdexcept>
#include <thread>

#include "device/FlashCorvane.h"
#include "device/RegisterMap.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/Trace.h"

namespace {

// The loader programs whole blocks of this size.
constexpr std::uint32_t kBlockSize = 128;
constexpr std::int32_t kPollIntervalMs = 100;

// Two levels up from the host's directory; the loader's host side runs on one kind of system.
constexpr auto kLoaderSubdirectory = R"(..\..\merrow\)";
constexpr auto kLoaderFile = "FlashLoaderMerrow.out";

std::int32_t BudgetMs(std::int32_t seconds) {
    using Limits = std::numeric_limits<std::int32_t>;
    const std::int64_t milliseconds = std::int64_t{seconds} * 1000;
    return static_cast<std::int32_t>(
        std::clamp<std::int64_t>(milliseconds, Limits::min(), Limits::max()));
}

std::uint32_t ParameterBlock(std::uint32_t index) {
    return LoaderMemory::ParameterBlocks + index * LoaderMemory::ParameterBlockSize;
}

// The loader needs no host call to go on, so this wait is a local one.
void SleepForPollInterval() {
    using Clock = std::chrono::steady_clock;
    const auto deadline = Clock::now() + std::chrono::milliseconds(kPollIntervalMs);
    while (Clock::now() < deadline)
        std::this_thread::sleep_until(deadline);
}

/// A section completed to whole blocks with what the target holds around it. It refers to the
/// caller's bytes and copies none of them; its size can exceed 32 bits.
struct WidenedImage {
    using Block = std::array<std::uint8_t, kBlockSize>;
    using Chunk = std::array<std::uint8_t, LoaderMemory::BufferSize>;

    const std::uint8_t* data;
    std::uint32_t length;
    std::uint32_t start;     ///< of the first block
    std::uint32_t headSize;  ///< bytes before the section, in its first block
    std::uint32_t padSize;   ///< bytes behind the section, in its last block
    Block head{};
    Block pad{};

    std::uint64_t DataEnd() const { return std::uint64_t{headSize} + length; }
    std::uint64_t Size() const { return DataEnd() + padSize; }

    /// The bytes of a chunk: the caller's own, or put together in `composed` where the chunk has
    /// some of the others.
    const std::uint8_t* Bytes(std::uint64_t offset, std::uint32_t count, Chunk& composed) const {
        const std::uint64_t begin = std::max<std::uint64_t>(offset, headSize);
        const std::uint64_t end = std::min(offset + count, DataEnd());
        if (end - begin == count) return data + (begin - headSize);
        auto at = composed.begin();
        if (offset < headSize) at = std::copy_n(head.begin(), headSize, at);
        at = std::copy(data + (begin - headSize), data + (end - headSize), at);
        if (offset + count > DataEnd()) std::copy_n(pad.begin(), padSize, at);
        return composed.data();
    }
};

// The blocks that the section begins and ends in are read before the target is touched.
WidenedImage Widen(const HostAccess& host, const std::uint8_t* data, std::uint32_t address,
                   std::uint32_t length, std::int16_t page) {
    const std::uint32_t headSize = address % kBlockSize;
    const std::uint32_t lastSize = (headSize + length) % kBlockSize;
    const std::uint32_t padSize = lastSize == 0 ? 0 : kBlockSize - lastSize;
    WidenedImage image{data, length, address - headSize, headSize, padSize};
    if (headSize > 0) host.ReadBytes(image.head.data(), headSize, image.start, page);
    if (padSize > 0) host.ReadBytes(image.pad.data(), padSize, address + length, page);
    return image;
}

void StartLoader(const HostAccess& host) {
    host.HaltTarget();
    const std::string directory = host.Directory() + kLoaderSubdirectory;
    host.LoadProgram(kLoaderFile, directory);
    host.RunTarget();
}

// The bytes go first: the loader takes the chunk as soon as its status is pending.
void ProgramChunk(const HostAccess& host, const std::uint8_t* chunk, std::uint32_t count,
                  std::uint32_t flashAddress, std::uint32_t index, std::int16_t page) {
    const std::uint32_t buffer = LoaderMemory::Buffers + index * LoaderMemory::BufferSize;
    host.WriteBytes(chunk, count, buffer, page);
    const std::array<std::uint32_t, 3> parameters = {flashAddress, count,
                                                     LoaderMemory::ChunkPending};
    host.WriteBytes(parameters.data(), sizeof parameters,
                    ParameterBlock(index) + LoaderMemory::ChunkOffset, page);
}

void WaitForLoader(const HostAccess& host, std::uint32_t index, std::int32_t& budgetMs) {
    const std::uint32_t status = ParameterBlock(index) + LoaderMemory::StatusOffset;
    while (budgetMs > 0) {
        if (host.ReadWord(status) != LoaderMemory::ChunkPending) return;
        budgetMs -= kPollIntervalMs;
        SleepForPollInterval();
    }
    throw std::runtime_error("Flash programming timed out.");
}

// While the loader works on one chunk, the next one goes into the other buffer. Each wait is for
// the chunk handed over before the last one, so the first finds the idle second block, and nobody
// waits for the last chunk here.
void StreamToLoader(const HostAccess& host, const WidenedImage& image, std::int32_t budgetMs,
                    std::int16_t page) {
    WidenedImage::Chunk composed;
    std::uint32_t index = 0;
    for (std::uint64_t offset = 0; offset < image.Size();) {
        const auto count = static_cast<std::uint32_t>(
            std::min<std::uint64_t>(LoaderMemory::BufferSize, image.Size() - offset));
        const auto flashAddress = static_cast<std::uint32_t>(image.start + offset);
        ProgramChunk(host, image.Bytes(offset, count, composed), count, flashAddress, index, page);
        index ^= 1;
        offset += count;
        WaitForLoader(host, index, budgetMs);
    }
}

}  // namespace

// Only failures of the stream are shown here; whatever fails before it is the caller's to report.
bool FlashCorvane::Program(const std::uint8_t* data, std::uint32_t address, std::uint32_t length,
                           std::int16_t page) {
    TRACE(Entry, "FlashCorvane::Program(%p,0x%08X,0x%08X,%d)", static_cast<const void*>(data),
          address, length, page);
    const WidenedImage image = Widen(p_mHost, data, address, length, page);
    StartLoader(p_mHost);
    const std::int32_t budgetMs =
        BudgetMs(ParseDecimal(p_mHost.GetSetting(Setting::FlashTimeoutValue)));
    try {
        StreamToLoader(p_mHost, image, budgetMs, page);
    } catch (const std::exception& error) {
        p_mHost.ShowErrorText(std::string("Flash Programmer: ") + error.what());
        TRACE(Result, "FlashCorvane::Program() = false %s", error.what());
        return false;
    }
    TRACE(Result, "FlashCorvane::Program() = true");
    return true;
}
