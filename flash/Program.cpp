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

}  // namespace

/// A section completed to whole blocks with what the target holds around it. Its size can exceed
/// 32 bits.
struct FlashCorvane::WidenedImage {
    std::uint32_t start;
    std::vector<std::uint8_t> bytes;
};

// Only failures of the stream are shown here; whatever fails before it is the caller's to report.
bool FlashCorvane::Program(const std::uint8_t* data, std::uint32_t address, std::uint32_t length,
                           std::int16_t page) {
    TRACE(Entry, "FlashCorvane::Program(%p,0x%08X,0x%08X,%d)", static_cast<const void*>(data),
          address, length, page);
    const WidenedImage image = Widen(data, address, length, page);
    StartLoader();
    const std::int32_t budgetMs =
        BudgetMs(ParseDecimal(p_mHost.GetSetting(Setting::FlashTimeoutValue)));
    try {
        StreamToLoader(image, budgetMs, page);
    } catch (const std::exception& error) {
        p_mHost.ShowErrorText(std::string("Flash Programmer: ") + error.what());
        TRACE(Result, "FlashCorvane::Program() = false %s", error.what());
        return false;
    }
    TRACE(Result, "FlashCorvane::Program() = true");
    return true;
}

FlashCorvane::WidenedImage FlashCorvane::Widen(const std::uint8_t* data, std::uint32_t address,
                                               std::uint32_t length, std::int16_t page) {
    const std::uint32_t head = address % kBlockSize;
    const std::uint32_t start = address - head;
    const std::uint64_t total = std::uint64_t{length} + head;
    const std::uint64_t size = (total + kBlockSize - 1) / kBlockSize * kBlockSize;
    const std::size_t pad = size - total;

    // Had whole before the target is touched, and filled without writing any byte twice.
    WidenedImage image{start, {}};
    std::vector<std::uint8_t>& bytes = image.bytes;
    bytes.reserve(size);
    bytes.resize(head);
    if (head > 0) p_mHost.ReadBytes(bytes.data(), head, start, page);
    bytes.insert(bytes.end(), data, data + length);
    bytes.resize(size);
    if (pad > 0) {
        const auto behind = static_cast<std::uint32_t>(start + total);
        p_mHost.ReadBytes(bytes.data() + total, pad, behind, page);
    }
    return image;
}

void FlashCorvane::StartLoader() {
    p_mHost.HaltTarget();
    const std::string directory = p_mHost.Directory() + kLoaderSubdirectory;
    p_mHost.LoadProgram(kLoaderFile, directory);
    p_mHost.RunTarget();
}

// While the loader works on one chunk, the next one goes into the other buffer. Each wait is for
// the chunk handed over before the last one, so the first finds the idle second block, and nobody
// waits for the last chunk here.
void FlashCorvane::StreamToLoader(const WidenedImage& image, std::int32_t budgetMs,
                                  std::int16_t page) {
    std::uint32_t index = 0;
    std::uint32_t flashAddress = image.start;
    for (std::size_t offset = 0; offset < image.bytes.size();) {
        const auto count = static_cast<std::uint32_t>(
            std::min<std::size_t>(LoaderMemory::BufferSize, image.bytes.size() - offset));
        ProgramChunk(image.bytes.data() + offset, count, flashAddress, index, page);
        index ^= 1;
        offset += count;
        flashAddress += count;
        WaitForLoader(index, budgetMs);
    }
}

// The bytes go first: the loader takes the chunk as soon as its status is pending.
void FlashCorvane::ProgramChunk(const std::uint8_t* chunk, std::uint32_t count,
                                std::uint32_t flashAddress, std::uint32_t index,
                                std::int16_t page) {
    const std::uint32_t buffer = LoaderMemory::Buffers + index * LoaderMemory::BufferSize;
    p_mHost.WriteBytes(chunk, count, buffer, page);
    const std::array<std::uint32_t, 3> parameters = {flashAddress, count,
                                                     LoaderMemory::ChunkPending};
    p_mHost.WriteBytes(parameters.data(), sizeof parameters,
                       ParameterBlock(index) + LoaderMemory::ChunkOffset, page);
}

void FlashCorvane::WaitForLoader(std::uint32_t index, std::int32_t& budgetMs) {
    const std::uint32_t status = ParameterBlock(index) + LoaderMemory::StatusOffset;
    while (budgetMs > 0) {
        if (p_mHost.ReadWord(status) != LoaderMemory::ChunkPending) return;
        budgetMs -= kPollIntervalMs;
        SleepForPollInterval();
    }
    throw std::runtime_error("Flash programming timed out.");
}
