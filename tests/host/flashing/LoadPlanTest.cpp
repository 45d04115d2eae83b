// The plan of a load.

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <optional>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "host/base/Text.h"
#include "host/flashing/Load.h"
#include "host/flashing/LoadPlan.h"

namespace host {
namespace {

using namespace std::chrono_literals;

image::Section Bytes(std::uint32_t address, std::size_t count, std::uint8_t value) {
    return {address, std::vector<std::uint8_t>(count, value)};
}

std::string RangesOf(const auto& parts, auto rangeOf) {
    std::string text;
    for (const auto& part : parts) {
        const base::AddressRange range = rangeOf(part);
        text += fmt::format("{:x}-{:x} ", range.first, range.last);
    }
    return text;
}

TEST(LoadPlan, ErasesJoinsAndCounts) {
    using Kind = EraseChoice::Kind;
    image::Image image;  // in sector 0; behind a short gap in sector 1; far behind in 4 to 6
    for (const auto& [address, bytes] :
         {Bytes(0x10, 0x20, 1), Bytes(0x600, 0x10, 2), Bytes(0x1000, 0x801, 3)})
        image.Add(address, bytes, "test");
    const std::pair<EraseChoice, const char*> cases[] = {
        {{Kind::Necessary, {}},
         "10-60f 1000-1800 in f00; erased 0-7ff 1000-1bff 1400 in 5, bcf cleared"},
        {{Kind::Nothing, {}}, "10-2f 600-60f 1000-1800 in 980; erased 0 in 0, 0 cleared"},
        {{Kind::Everything, {}},
         "10-60f 1000-1800 in f00; erased 0-ffff 10000 in 64, f7cf cleared"},
        {{Kind::Range, {0x3FF, 0x400}},
         "10-60f 1000-1800 in f00; erased 0-7ff 800 in 2, 7d0 cleared"},
        {{Kind::Range, {0x5FF, 0x600}},
         "10-2f 600-60f 1000-1800 in 980; erased 400-7ff 400 in 1, 3f0 cleared"},
        {{Kind::Range, {2, 1}}, "10-2f 600-60f 1000-1800 in 980; erased 0 in 0, 0 cleared"},
    };
    for (const auto& [erase, expected] : cases) {
        const LoadPlan plan = PlanLoad({.erase = erase}, image, {}, {0x10000, 0x400});
        const auto sections = RangesOf(plan.sections, [](const image::Section& section) {
            return base::AddressRange{section.address, section.Last()};
        });
        const auto erased = RangesOf(plan.erased, [](const auto& run) { return run; });
        EXPECT_EQ(fmt::format("{}in {:x}; erased {}{:x} in {}, {:x} cleared", sections,
                              plan.transferBytes, erased, plan.erasedBytes, plan.sectorCount,
                              plan.clearedBytes),
                  expected);
        EXPECT_EQ(plan.imageBytes, 0x831U);
        EXPECT_EQ(plan.erase, erase);
    }
}

/// What flash holds after erasing the runs and programming the sections: cells only lose bits.
std::vector<std::uint8_t> FlashAfter(const std::vector<base::AddressRange>& erased,
                                     const std::vector<image::Section>& sections) {
    std::vector<std::uint8_t> flash(0x8000, 0x5A);
    for (const base::AddressRange& run : erased)
        std::fill(flash.begin() + run.first, flash.begin() + run.last + 1, std::uint8_t{0xFF});
    for (const image::Section& section : sections)
        for (std::size_t i = 0; i < section.bytes.size(); ++i)
            flash[section.address + i] &= section.bytes[i];
    return flash;
}

TEST(LoadPlan, JoiningChangesNoByteOfFlash) {
    std::mt19937 engine(4711);
    const auto random = [&](std::uint32_t below) {
        return static_cast<std::uint32_t>(engine() % below);
    };
    for (int round = 0; round < 200; ++round) {
        image::Image image;
        for (std::uint32_t address = 0; address < 0x7000;) {
            const std::uint32_t count = 1 + random(700);
            image.Add(address,
                      std::vector<std::uint8_t>(count, static_cast<std::uint8_t>(random(256))),
                      "test");
            address += count + random(4000);
        }
        const EraseChoice erase{static_cast<EraseChoice::Kind>(random(4)),
                                {random(0x4000), 0x4000 + random(0x4000)}};
        const LoadPlan plan = PlanLoad({.erase = erase}, image, {}, {0x8000, 0x400});
        EXPECT_LE(plan.sections.size(), image.Sections().size());
        EXPECT_EQ(FlashAfter(plan.erased, plan.sections), FlashAfter(plan.erased, image.Sections()))
            << "round " << round;
    }
}

TEST(LoadPlan, GivesEachStepItsTimeAndItsTotal) {
    image::Image image;
    image.Add(0x102, std::vector<std::uint8_t>(30000), "test");
    LoadRequest request{.checks = {true, true, true}};
    const FlashGeometry flash{0x10000, 0x400};
    const LoadPlan plan = PlanLoad(request, image, {}, flash);
    EXPECT_EQ(plan.chunkTime, 30s);
    EXPECT_EQ(plan.sectionTime, 32s);  // 15 chunks, and a second for 5 of them
    request.time.chosen = true;
    EXPECT_EQ(PlanLoad(request, image, {}, flash).sectionTime, 30s);
    const std::pair<Phase, std::uint64_t> totals[] = {
        {Phase::Erase, 0x7800}, {Phase::Program, 30080},    {Phase::BlankCheck, 30004},
        {Phase::Look, 0},       {Phase::Checksum, 0x10000}, {Phase::Verify, 30000},
    };
    Reporter reporter({Verbosity::Quiet, false, "none"});
    WorkMeter all(reporter);
    ExpectLoad(all, plan, flash);
    for (const auto& [phase, total] : totals)
        EXPECT_EQ(all.Phases()[phase].totalBytes, total) << Name(phase).id;
    WorkMeter few(reporter);
    ExpectLoad(few, PlanLoad({.checks = {false, false, false}}, image, {}, flash), flash);
    for (const Phase phase : {Phase::BlankCheck, Phase::Checksum, Phase::Verify})
        EXPECT_EQ(few.Phases()[phase].totalBytes, 0U);
}

TEST(LoadPlan, LeavesAloneWhatHoldsTheImage) {
    image::Image image;
    image.Add(0x400, std::vector<std::uint8_t>(0xC00, 0x11), "test");
    image::Image now;
    now.Add(0xC00, std::vector<std::uint8_t>(0x400, 0x11), "test");
    const LoadPlan plan = PlanLoad({}, image, now, {0x1000, 0x400, true});
    EXPECT_EQ(plan.unchanged.Ranges(), (std::vector<base::AddressRange>{{0xC00, 0xFFF}}));
    EXPECT_EQ(plan.erased, (std::vector<base::AddressRange>{{0x400, 0xBFF}}));
    EXPECT_EQ(plan.sections, (std::vector<image::Section>{Bytes(0x400, 0x800, 0x11)}));
    EXPECT_EQ(plan.unchangedBytes, 0x400U);
    EXPECT_FALSE(plan.ErasesWhole());
    image.Add(0, std::vector<std::uint8_t>(1), "test");
    EXPECT_TRUE(PlanLoad({}, image, {}, {0x1000, 0x400, true}).ErasesWhole());
    EXPECT_FALSE(PlanLoad({}, image, {}, {0x1000, 0x400, false}).ErasesWhole());
}

TEST(Load, SaysWhatCanStillBeTried) {
    LoadPlan plan;
    plan.erased = {{0x400, 0x7FF}};
    const std::pair<std::optional<std::uint32_t>, const char*> advice[] = {
        {{}, "these bytes were not programmed"},
        {0x7FF, "some bits stay 0 although"},
        {0x800, "some bits were not erased first"},
    };
    for (const auto& [address, expected] : advice)
        EXPECT_TRUE(AdviceAfter(plan, {.notErased = address}).starts_with(expected));
}

}  // namespace
}  // namespace host
