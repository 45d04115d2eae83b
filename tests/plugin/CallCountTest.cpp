// How many host calls work takes: each is a round trip to the probe. The counts are those of the
// table that script/bench prints; run with CORVANE_WRITE_TRANSCRIPTS=1 to write them anew.

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <sstream>

#include "bench/support/Workloads.h"

namespace {

// What the work may cost beyond the least: once, and as a factor.
struct Allowance {
    const char* name;
    std::uint64_t once;
    double factor;
};
constexpr Allowance kAllowances[] = {
    {"program", 60, 1},      // bringing the device up, starting the loader
    {"erase", 72, 1.34},     // each sector asks whether to be verbose
    {"blank-check", 14, 2},  // each read updates the display
    {"checksum", 16, 2},    {"program-sparse", 50, 4},  // each segment brings the device up again
};

TEST(CallCounts, AreAsRecordedAndNearTheLeast) {
    std::string actual =
        "work bytes@address: settings+reads+writes+control+pauses+display, bytes in, bytes out, "
        "ms paused\n";
    for (const test::Workload& work : test::CountedWorkloads()) {
        const test::Counts counts = test::CountCalls(work);
        const auto line = fmt::format("{} {}@{:x}: {}, {}, {}, {}\n", work.name, work.sizeBytes,
                                      work.address, fmt::join(counts.calls, "+"), counts.bytesRead,
                                      counts.bytesWritten, counts.pausedMs);
        actual += line;
        const auto* allowance = std::ranges::find(kAllowances, work.name, &Allowance::name);
        ASSERT_NE(allowance, std::end(kAllowances));
        const auto most = static_cast<double>(allowance->once) +
                          static_cast<double>(work.leastCalls) * allowance->factor;
        EXPECT_LE(static_cast<double>(counts.Calls()), most) << line;
    }
    const std::string path = TRANSCRIPT_DIRECTORY "/../call-counts.txt";
    if (std::getenv("CORVANE_WRITE_TRANSCRIPTS") != nullptr) {
        std::ofstream(path) << actual;
        FAIL() << path << ": written, read it";
    }
    std::ostringstream expected;
    expected << std::ifstream(path).rdbuf();
    EXPECT_EQ(actual, expected.str());
}

}  // namespace
