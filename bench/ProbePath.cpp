// Times program loads through a GDB server as a probe's: a real socket, a delay for each request, a
// loader that takes its time. The plug-in's accesses are made in its order, through the host's wait
// and the client. Prints a table, and adds it to a JSON file where asked.

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <fstream>

#include "bench/AddedFlash.h"
#include "bench/DelayLine.h"
#include "bench/LoaderFile.h"
#include "bench/ProbeServer.h"
#include "bench/Table.h"
#include "host/facts/FlashMemory.h"
#include "host/facts/LoaderMemory.h"
#include "host/targets/LoaderWait.h"
#include "target/gdb/client/GdbTarget.h"

namespace {

namespace gdb = target::gdb;
namespace plugin = host::plugin;
using Clock = std::chrono::steady_clock;
using Milliseconds = std::chrono::duration<double, std::milli>;

constexpr std::uint32_t kSizeBytes = 256 * 1024;
constexpr std::uint32_t kChunks = kSizeBytes / plugin::kChunkBytes;
constexpr std::uint32_t kRamEnd = 0x20010000;

constexpr gdb::Mailbox kMailbox{
    plugin::kParameterBlocks[0],
    2 * (plugin::kParameterBlocks[1] - plugin::kParameterBlocks[0]),
    plugin::kStatusPending,
};

class NobodyWatches final : public host::LoaderObserver {
  public:
    void HandingOver(const base::AddressRange&) override {}
    void HandedOver(const base::AddressRange&) override {}
    void Programmed(const base::AddressRange&) override {}
};

struct Setup {
    bool live;
    int delayMs;
    double chunkMs;
};

struct Result {
    Milliseconds time;
    Milliseconds limit;
    double packets;  ///< for a chunk
};

void WriteBytes(target::Target& target, std::uint32_t chunk) {
    static const std::string bytes(plugin::kChunkBytes, 'x');
    target.Write(bytes.data(), bytes.size(),
                 plugin::kLoaderBuffers + chunk % 2 * plugin::kChunkBytes, plugin::kRamPage, 1);
}

void HandOver(target::Target& target, std::uint32_t chunk) {
    const std::array<std::uint32_t, 3> parameters{chunk * plugin::kChunkBytes, plugin::kChunkBytes,
                                                  plugin::kStatusPending};
    target.Write(parameters.data(), sizeof parameters,
                 plugin::kParameterBlocks[chunk % 2] + plugin::kChunkAddressOffset,
                 plugin::kRamPage, 1);
}

std::uint32_t StatusOf(target::Target& target, std::uint32_t chunk) {
    std::uint32_t status = 0;
    target.Read(&status, 1, plugin::kParameterBlocks[chunk % 2] + plugin::kStatusOffset,
                plugin::kRamPage, sizeof status);
    return status;
}

/// As the plug-in does it, to the end of the last chunk.
void Stream(host::LoaderWait& wait) {
    for (std::uint32_t chunk = 0; chunk < kChunks; ++chunk) {
        WriteBytes(wait, chunk);
        HandOver(wait, chunk);
        while (StatusOf(wait, chunk + 1) == plugin::kStatusPending)
            ;
    }
    wait.AwaitIdle();
}

template <typename Action>
Milliseconds Median(Action action) {
    std::array<Milliseconds, 15> times{};
    for (Milliseconds& time : times) {
        const auto before = Clock::now();
        action();
        time = Clock::now() - before;
    }
    std::ranges::nth_element(times, times.begin() + times.size() / 2);
    return times[times.size() / 2];
}

/// What the protocol and the flash need, with exchanges as they are on this path while the target
/// stands still. An interrupt and a resume are taken for short ones.
Milliseconds Limit(const Setup& setup, gdb::GdbTarget& client) {
    const Milliseconds bytes = Median([&] { WriteBytes(client, 0); });
    const Milliseconds words = Median([&] { HandOver(client, 0); });
    const Milliseconds look = Median([&] { StatusOf(client, 0); });
    const Milliseconds flash(setup.chunkMs);
    if (setup.live) return kChunks * std::max(bytes + words + look, flash);
    return kChunks / 2 * (2 * bytes + 2 * words + 3 * look + 2 * flash);
}

Result Measure(const Setup& setup, const bench::LoaderFile& loader) {
    bench::ProbeServer server(
        fmt::format("dorna,flash=512K,latency=1ns,bandwidth=0,chunk-time={}us",
                    setup.chunkMs * 1000),
        setup.live);
    bench::DelayLine line(server.Where(), std::chrono::milliseconds(setup.delayMs));
    gdb::GdbOptions options;
    options.server = gdb::FindProfile(setup.live ? "generic" : "corvane");
    options.loader = loader.path;
    options.ramEnd = kRamEnd;
    gdb::GdbTarget client(line.Where(), options, kMailbox, {}, {});
    const Milliseconds limit = Limit(setup, client);
    NobodyWatches nobody;
    host::LoaderWait wait(client, nobody, [] { return false; });
    wait.LoadProgram("", "");
    wait.Run();
    const std::uint64_t packets = client.PacketCount();
    const auto begin = Clock::now();
    Stream(wait);
    const Milliseconds time = Clock::now() - begin;
    const auto sent = static_cast<double>(client.PacketCount() - packets);
    client.Release(false);
    return {time, limit, sent / kChunks};
}

bench::Table Measurements() {
    const bench::LoaderFile loader;
    bench::Table table(
        "probe",
        "Programming 256 KiB through a GDB server's socket, in ms. The limit: with "
        "stops, 7 exchanges and the flash's time for each two chunks; live, for each "
        "chunk the slower of 3 exchanges and the flash",
        {"target", "delay ms", "chunk ms", "limit", "time", "time/limit", "packets a chunk"});
    for (const bool live : {false, true})
        for (const int delayMs : {0, 1, 3, 10})
            for (const double chunkMs : {0.2, 5.0, 20.0}) {
                const Result result = Measure({live, delayMs, chunkMs}, loader);
                table.Add({live ? "live" : "stops", delayMs, chunkMs, result.limit.count(),
                           result.time.count(), result.time / result.limit, result.packets});
            }
    return table;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 1 && (argc != 3 || std::string_view(argv[1]) != "--json")) {
        fmt::print(stderr, "usage: corvane_probe_bench [--json FILE]\n");
        return 2;
    }
    const bench::Table tables[] = {Measurements(), bench::AddedFlashTable()};
    for (const bench::Table& table : tables)
        table.Print();
    if (argc == 1) return 0;
    nlohmann::json results = nlohmann::json::object();
    if (std::ifstream file(argv[2]); file) results = nlohmann::json::parse(file, nullptr, false);
    if (!results.is_object()) results = nlohmann::json::object();
    for (const bench::Table& table : tables)
        table.AddTo(results);
    std::ofstream(argv[2]) << results.dump(2) << '\n';
    return 0;
}
