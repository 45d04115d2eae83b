#include "bench/support/WholeLoads.h"

#include <fmt/format.h>

#include <algorithm>

#include "bench/support/LeanHost.h"
#include "host/flashing/Unchanged.h"
#include "host/targets/LoaderWait.h"
#include "target/simulated/SimulatedDevice.h"
#include "tests/support/VirtualTime.h"

namespace test {

namespace {

using Seconds = ToolTime::Seconds;

constexpr std::uint32_t kSizeBytes = 1 << 20;
constexpr std::uint32_t kChunkBytes = 2048;
constexpr std::uint32_t kChunks = kSizeBytes / kChunkBytes;
constexpr std::uint32_t kHandshakeBytes = 12 + 4;  ///< a chunk's parameters and its status

/// Counts the chunks that were seen done.
class Chunks final : public host::LoaderObserver {
  public:
    void HandingOver(const base::AddressRange&) override {}
    void HandedOver(const base::AddressRange&) override {}
    void Programmed(const base::AddressRange&) override { ++count; }

    std::uint64_t count = 0;
};

struct Board {
    explicit Board(const Link& link, const char* kind = "dorna,flash=2M")
        : device(target::ParseDeviceOptions(
                     fmt::format("{},latency={}us,bandwidth={},chunk-time={}ms", kind,
                                 link.latencyUs, link.bandwidthKB * 1000, link.chunkMs)),
                 &clock) {}

    Seconds Now() const { return device.Now(); }

    VirtualClock clock;
    target::SimulatedDevice device;
};

/// A load of erased flash, until the loader is done as far as the host looks.
void Load(LeanHost& host, const char* option, const Sections& sections) {
    static const std::vector<unsigned char> image(kSizeBytes, 0x5A);
    host.settings["FlashProgramOption"] = option;
    host.settings["FlashTimeoutValue"] = "100000";  // for all waits together
    Plugin plugin(host);
    plugin->ResetSettings(0);
    for (const auto& [address, sizeBytes] : sections) {
        plugin->WriteDataToFlash(image.data(), address, sizeBytes, 1);
        host.HaltTarget();
    }
}

Seconds Polling(const Link& link) {
    Board board(link);
    LeanHost host(board.device);
    const Seconds before = board.Now();
    Load(host, kNoErase, {{0, kSizeBytes}});
    return board.Now() - before;
}

Seconds Samples(const Link& link) {
    Board board(link);
    board.device.Halt();
    host::image::Image image;
    image.Add(0, std::vector<std::uint8_t>(kSizeBytes, 0x5A), "bench");
    const Seconds before = board.Now();
    for (const base::AddressRange& block : host::SampleBlocks(image, {kSizeBytes, 0x2000})) {
        std::vector<std::uint8_t> bytes(block.Size());
        board.device.Read(bytes.data(), bytes.size(), block.first, 0, 1);
    }
    return board.Now() - before;
}

}  // namespace

ToolTime::Seconds LoadTime(const Link& link, const char* device, const char* option,
                           const Sections& sections) {
    Board board(link, device);
    Chunks chunks;
    host::LoaderWait wait(board.device, chunks);
    LeanHost host(wait);
    const Seconds before = board.Now();
    Load(host, option, sections);
    return board.Now() - before;
}

ToolTime MeasureTool(const Link& link) {
    ToolTime time{};
    Board board(link);
    Chunks chunks;
    host::LoaderWait wait(board.device, chunks);
    LeanHost host(wait);
    const Seconds before = board.Now();
    const std::uint64_t accessesBefore = board.device.AccessCount();
    Load(host, kNoErase, {{0, kSizeBytes}});
    time.waiting = board.Now() - before;
    time.chunks = chunks.count;
    // Everything else is as much for each chunk, or for the load.
    time.looks = board.device.AccessCount() - accessesBefore - 2 * time.chunks;
    const Seconds perChunk = 3 * std::chrono::microseconds(link.latencyUs) +
                             Seconds((kChunkBytes + kHandshakeBytes) / (link.bandwidthKB * 1000.0));
    time.limit = static_cast<double>(kChunks) *
                     std::max(perChunk, Seconds(std::chrono::milliseconds(link.chunkMs))) +
                 Seconds(std::chrono::milliseconds(host.counts.pausedMs));
    time.polling = Polling(link);
    time.samples = Samples(link);
    return time;
}

std::vector<Link> ToolLinks() {
    std::vector<Link> links;
    for (const std::uint32_t latencyUs : {0U, 30U, 1000U, 3000U})
        for (const std::uint32_t bandwidthKB : {64U, 200U, 1000U})
            for (const std::uint32_t chunkMs : {5U, 10U, 20U})
                links.push_back({latencyUs, bandwidthKB, chunkMs});
    return links;
}

}  // namespace test
