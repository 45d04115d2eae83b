// The tables of whole loads.

#include "bench/Measurements.h"
#include "bench/support/WholeLoads.h"

namespace bench {

using namespace test;

Table ToolTable() {
    Table table("tool",
                "Programming 1 MiB, in seconds: the limit (for each chunk the slower of link and "
                "flash, and the fixed pauses), a host that waits for the loader, one that leaves "
                "it to the plug-in's polls; and what the samples add when nothing is there",
                {"latency us", "KB/s", "chunk ms", "limit", "waiting", "waiting/limit", "polling",
                 "polling/limit", "looks a chunk", "samples %"});
    for (const Link& link : ToolLinks()) {
        const ToolTime time = MeasureTool(link);
        table.Add({link.latencyUs, link.bandwidthKB, link.chunkMs, time.limit.count(),
                   time.waiting.count(), time.Ratio(), time.polling.count(), time.RatioOfPolling(),
                   static_cast<double>(time.looks) / static_cast<double>(time.chunks),
                   time.samples / time.waiting * 100});
    }
    return table;
}

// What decides whether a run of unchanged sectors is programmed along.
Table StartsTable() {
    Table table("starts",
                "What one more section costs (the loader's start and the fixed pauses), and what "
                "erasing and programming one more sector costs, in ms",
                {"device", "latency us", "KB/s", "chunk ms", "section", "sector erased",
                 "sector programmed", "sectors a section is worth"});
    constexpr std::uint32_t kFar = 0x80000;
    for (const auto& [kind, sector] :
         {std::pair{"tolva,flash=2M", 0x400U}, {"dorna,flash=2M,sector=8K", 0x2000U}}) {
        for (const Link& link : {Link{30, 1000, 5}, {30, 1000, 20}, {1000, 64, 10}}) {
            const auto ms = [&, device = kind](const char* option, const Sections& sections) {
                return LoadTime(link, device, option, sections).count() * 1e3;
            };
            const double erased =
                (ms(kNecessary, {{0, 17 * sector}}) - ms(kNecessary, {{0, sector}}) -
                 ms(kNoErase, {{0, 17 * sector}}) + ms(kNoErase, {{0, sector}})) /
                16;
            const double programmed =
                (ms(kNoErase, {{0, 17 * sector}}) - ms(kNoErase, {{0, sector}})) / 16;
            const double section = ms(kNecessary, {{0, sector}, {kFar, sector}}) -
                                   ms(kNecessary, {{0, sector}}) - erased - programmed;
            table.Add({kind, link.latencyUs, link.bandwidthKB, link.chunkMs, section, erased,
                       programmed, section / (erased + programmed)});
        }
    }
    return table;
}

}  // namespace bench
