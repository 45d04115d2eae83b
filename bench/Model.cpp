#include "bench/Model.h"

#include <fmt/format.h>

#include "bench/Measurements.h"

namespace bench {

namespace {

constexpr std::uint32_t kLoadSizeBytes = 256 * 1024;

// What most users do: the whole flash is erased, then one section programmed.
void RunLoad(test::LeanHost& host, test::Plugin& plugin, const test::Workload& work) {
    static const std::vector<unsigned char> image(kLoadSizeBytes, 0x5A);
    host.settings["FlashProgramOption"] = "Use the Erase Options Specified Below";
    host.settings["FlashEraseType"] = "Entire Flash";
    plugin->ResetSettings(0);
    plugin->WriteDataToFlash(image.data(), work.address, work.sizeBytes, 1);
}

}  // namespace

ModelledTime Model(const test::Workload& work, const Link& link) {
    test::VirtualClock clock;
    target::SimulatedDevice device(target::ParseDeviceOptions(fmt::format(
                                       "tolva,flash=16M,latency={}us,bandwidth={},chunk-time={}ms",
                                       link.latencyUs, link.bandwidthKB * 1000, link.chunkMs)),
                                   &clock);
    test::LeanHost host(device);
    host.settings["FlashTimeoutValue"] = "100000";  // for all waits together
    test::Plugin plugin(host);
    const target::TimeSpent before = device.Time();
    work.run(host, plugin, work);
    const target::TimeSpent after = device.Time();
    return {after.link - before.link, after.pauses - before.pauses, after.clock - before.clock,
            device.LoaderBusyTime()};
}

Table ModelledTimeTable() {
    Table table("modelled time",
                "Modelled time of erasing everything and programming 256 KiB, in seconds. Overlap "
                "won: by loader and link working at once, less what is lost by polling late",
                {"latency us", "KB/s", "chunk ms", "total", "link", "fixed pauses",
                 "waiting for loader", "loader at work", "overlap won"});
    const test::Workload load{"load", 0, kLoadSizeBytes, RunLoad, 0};
    for (const std::uint32_t latencyUs : {0U, 30U, 1000U, 3000U}) {
        for (const std::uint32_t bandwidthKB : {64U, 200U, 1000U}) {
            for (const std::uint32_t chunkMs : {5U, 10U, 20U}) {
                const ModelledTime time = Model(load, {latencyUs, bandwidthKB, chunkMs});
                table.Add({latencyUs, bandwidthKB, chunkMs, time.Total().count(), time.link.count(),
                           time.pauses.count(), time.waiting.count(), time.loader.count(),
                           (time.loader - time.waiting).count()});
            }
        }
    }
    return table;
}

}  // namespace bench
