// Processor time: of the plug-in with the lean host, and of the same host calls alone. The
// difference is the plug-in's own work. The clock of the processor is a real one.

#include <algorithm>
#include <ctime>

#include "bench/Measurements.h"
#include "bench/Model.h"
#include "bench/ReplayHost.h"

namespace bench {

namespace {

constexpr std::uint32_t kKiB = 1024;
constexpr std::uint32_t kMiB = 1024 * kKiB;

double Now() {
    timespec time{};
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &time);
    return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) * 1e-9;
}

// The least of three means, each over a twentieth of a second and more.
template <typename Run>
double SecondsOf(Run run) {
    double least = 1e9;
    for (int i = 0; i < 3; ++i) {
        const double start = Now();
        double elapsed = 0;
        int runs = 0;
        while (elapsed < 0.05) {
            run();
            ++runs;
            elapsed = Now() - start;
        }
        least = std::min(least, elapsed / runs);
    }
    return least;
}

struct OwnTime {
    double plugin;
    double hostCalls;

    double Own() const { return std::max(plugin - hostCalls, 0.0); }
};

OwnTime Measure(const test::Workload& work) {
    test::NullTarget target;
    ReplayHost host(target);
    test::Plugin plugin(host);
    host.recording = true;
    work.run(host, plugin, work);
    host.recording = false;
    return {SecondsOf([&] { work.run(host, plugin, work); }), SecondsOf([&] { host.Replay(); })};
}

}  // namespace

Table OwnWorkTable() {
    Table table(
        "own work",
        "Processor time in ms beside the same host calls replayed without the plug-in, and "
        "the difference as a share of the modelled time on the fastest link",
        {"work", "KiB", "plug-in", "host calls alone", "own", "ratio", "modelled s", "share %"});
    for (const auto make : {test::Program, test::Erase, test::BlankCheck, test::Checksum}) {
        for (const std::uint32_t sizeBytes : {64 * kKiB, 1 * kMiB, 16 * kMiB}) {
            const test::Workload work = make(0, sizeBytes);
            const OwnTime time = Measure(work);
            const double modelled = Model(work, kFastestLink).Total().count();
            table.Add({work.name, sizeBytes / kKiB, time.plugin * 1e3, time.hostCalls * 1e3,
                       time.Own() * 1e3, time.plugin / time.hostCalls, modelled,
                       time.Own() / modelled * 100});
        }
    }
    return table;
}

Table GrowthTable() {
    Table table("growth",
                "Processor time by size (128 MiB are 131072 sectors), and per KiB with the host "
                "calls and without",
                {"work", "KiB", "own ms", "ns per KiB with calls", "own ns per KiB"});
    for (const auto make : {test::Program, test::Erase, test::BlankCheck, test::Checksum}) {
        for (std::uint32_t sizeBytes = 64 * kKiB; sizeBytes <= 128 * kMiB;
             sizeBytes *= sizeBytes == 64 * kMiB ? 2 : 4) {
            const test::Workload work = make(0, sizeBytes);
            const OwnTime time = Measure(work);
            const double nsPerKiB = 1e9 * kKiB / sizeBytes;
            table.Add({work.name, sizeBytes / kKiB, time.Own() * 1e3, time.plugin * nsPerKiB,
                       time.Own() * nsPerKiB});
        }
    }
    return table;
}

}  // namespace bench
