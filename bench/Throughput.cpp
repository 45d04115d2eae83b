// Bytes a second of what reads the whole flash. Google Benchmark goes by processor time, which
// is a real one in this process.

#include <benchmark/benchmark.h>
#include <zlib.h>

#include <cstring>
#include <map>

#include "bench/Measurements.h"
#include "bench/ReplayHost.h"
#include "bench/support/Workloads.h"

namespace bench {

namespace {

constexpr std::uint32_t kSizeBytes = 16 << 20;
constexpr std::uint32_t kChunkBytes = 32752;

class RateCollector final : public benchmark::BenchmarkReporter {
  public:
    bool ReportContext(const Context&) override { return true; }
    void ReportRuns(const std::vector<Run>& runs) override {
        for (const Run& run : runs)
            rates[run.run_name.function_name] = run.counters.at("bytes_per_second");
    }

    std::map<std::string, double> rates;
};

template <typename Work>
void Register(const std::string& name, Work work) {
    benchmark::RegisterBenchmark(name.c_str(), [work](benchmark::State& state) {
        for (auto _ : state)
            work();
        state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) * kSizeBytes);
    });
}

// What a library function makes of as many chunks.
template <typename Function>
void RegisterFunction(const std::string& name, Function function) {
    Register(name, [function, chunk = std::vector<unsigned char>(kChunkBytes + 1, 0xFF)] {
        for (std::uint32_t done = 0; done < kSizeBytes; done += kChunkBytes)
            benchmark::DoNotOptimize(function(chunk.data()));
    });
}

void RegisterOperation(const std::string& name, test::LeanHost& host, test::Plugin& plugin,
                       const test::Workload& work) {
    Register(name, [&host, &plugin, work] { work.run(host, plugin, work); });
}

}  // namespace

Table ThroughputTable() {
    test::NullTarget target;
    ReplayHost host(target);
    test::Plugin plugin(host);
    const test::Workload blankCheck = test::BlankCheck(0, kSizeBytes);
    host.recording = true;
    blankCheck.run(host, plugin, blankCheck);
    host.recording = false;

    Register("host calls", [&host] { host.Replay(); });
    RegisterOperation("blank check", host, plugin, blankCheck);
    RegisterOperation("checksum", host, plugin, test::Checksum(0, kSizeBytes));
    RegisterFunction("memcmp", [](const unsigned char* chunk) {
        return std::memcmp(chunk, chunk + 1, kChunkBytes - 1);
    });
    RegisterFunction("crc32",
                     [](const unsigned char* chunk) { return crc32(0, chunk, kChunkBytes); });
    RateCollector collector;
    benchmark::RunSpecifiedBenchmarks(&collector);

    auto& rates = collector.rates;
    Table table("throughput", "Reading operations over 16 MiB, in MB/s of processor time",
                {"operation", "with the host calls", "without", "library function", "its rate",
                 "times as fast"});
    const auto add = [&](const char* operation, const char* function) {
        const double own = 1 / (1 / rates[operation] - 1 / rates["host calls"]);
        table.Add({operation, rates[operation] / 1e6, own / 1e6, function, rates[function] / 1e6,
                   rates[function] / own});
    };
    add("blank check", "memcmp");
    add("checksum", "crc32");
    return table;
}

}  // namespace bench
