// How near the host that waits for the loader comes to what link and flash allow: the counts and
// the simulated time behind the table that script/bench prints.

#include <fmt/format.h>
#include <gtest/gtest.h>

#include "bench/support/WholeLoads.h"

namespace {

TEST(ToolTime, IsNearTheLimitOnEveryLink) {
    for (const test::Link& link : test::ToolLinks()) {
        const test::ToolTime time = test::MeasureTool(link);
        const auto where = fmt::format("{} us, {} KB/s, {} ms a chunk: {} of {} s, {} looks",
                                       link.latencyUs, link.bandwidthKB, link.chunkMs,
                                       time.waiting.count(), time.limit.count(), time.looks);
        EXPECT_EQ(time.chunks, 512U) << where;
        EXPECT_LE(time.Ratio(), 1.05) << where;
        EXPECT_GE(time.Ratio(), 0.99) << where;  // the last chunk overlaps with a pause
        EXPECT_LE(static_cast<double>(time.looks), 3.5 * static_cast<double>(time.chunks)) << where;
        EXPECT_LE(time.samples, 0.05 * time.waiting) << where;
    }
}

}  // namespace
