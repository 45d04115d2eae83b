// How progress is drawn and held back, and how the time of phases is taken.

#include <gtest/gtest.h>

#include <chrono>
#include <thread>

#include "host/output/Progress.h"
#include "host/output/WorkMeter.h"

namespace host {
namespace {

using namespace std::chrono_literals;

TEST(Progress, FitsEveryTerminal) {
    const PhaseProgress half{5 * 1024, 10 * 1024, 2.0};
    EXPECT_EQ(BarLine(Phase::Program, half, 79),
              "Programming  [#####.....]  50 %  5 KiB of 10 KiB  2.0 s left  2.5 KiB/s");
    EXPECT_EQ(BarLine(Phase::Program, half, 40), "Programming   50 %  5 KiB of 10 KiB");
    EXPECT_EQ(BarLine(Phase::Program, half, 20), "Programming   50 %");
    EXPECT_EQ(Erasure(0, 40) + Erasure(40, 40), "\r\033[K\r\033[K");
    EXPECT_EQ(Erasure(79, 40) + Erasure(81, 40), "\033[1A\r\033[J\033[2A\r\033[J");
    const PhaseProgress many[] = {half, {}, {0, 1, 0}, {1, 1, 0}, {~0ULL / 200, ~0ULL / 100, 1e9}};
    for (const PhaseProgress& progress : many)
        for (std::size_t columns = 0; columns < 250; ++columns)
            EXPECT_LE(BarLine(Phase::BlankCheck, progress, columns).size(), columns);
}

TEST(Progress, IsHeldBackAndNeverRunsBackwards) {
    UpdateGate gate;
    const UpdateGate::Time start{};
    const struct {
        std::chrono::milliseconds at;
        Phase phase;
        std::uint64_t done;
        bool passes;
    } steps[] = {
        {0ms, Phase::Erase, 0, true},      {50ms, Phase::Erase, 10, false},
        {60ms, Phase::Program, 0, true},   {100ms, Phase::Erase, 20, true},
        {300ms, Phase::Erase, 15, false},  {301ms, Phase::Erase, 20, false},
        {302ms, Phase::Erase, 21, true},   {303ms, Phase::Erase, 100, true},
        {304ms, Phase::Erase, 100, false}, {305ms, Phase::Program, 100, true},
    };
    for (const auto& [at, phase, done, passes] : steps)
        EXPECT_EQ(gate.Passes(phase, {done, 100, 0}, start + at), passes) << at.count();
}

TEST(WorkMeter, GivesEachPhaseTheTimeInWhichItIsTheCurrentOne) {
    using Seconds = std::chrono::duration<double>;
    Reporter reporter({Verbosity::Quiet, false, "none"});
    WorkMeter meter(reporter);
    const auto start = std::chrono::steady_clock::now();
    meter.Begin(Phase::Read);
    std::this_thread::sleep_for(4ms);
    meter.Begin(Phase::Verify);
    std::this_thread::sleep_for(2ms);
    meter.End();
    const Seconds elapsed = std::chrono::steady_clock::now() - start;
    std::this_thread::sleep_for(2ms);
    meter.End();
    const double read = meter.Phases()[Phase::Read].seconds;
    const double verified = meter.Phases()[Phase::Verify].seconds;
    EXPECT_GE(read, 0.004);
    EXPECT_GE(verified, 0.002);
    EXPECT_LE(read + verified, elapsed.count());
}

}  // namespace
}  // namespace host
