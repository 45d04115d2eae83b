// Reading flash around a load: what is kept, left alone, drawn and compared.

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <utility>
#include <vector>

#include "host/flashing/Comparison.h"
#include "host/flashing/FlashMap.h"
#include "host/flashing/Forecast.h"
#include "host/flashing/KeptBytes.h"
#include "host/flashing/Unchanged.h"
#include "tests/host/flashing/FakeFlash.h"

namespace host {
namespace {

TEST(KeptBytes, AreThoseBetweenTheSectionsOfAnImage) {
    image::Image image;
    image.Add(2, {0x22, 0x33}, "image");
    image.Add(6, {0x66}, "image");
    image.Add(20, {0x20}, "image");
    image::Image contents;
    contents.Add(0, {1, 0xFF, 0, 0, 4, 5, 0, 0xFF, 8, 0xFF, 10, 0xFF}, "flash");
    contents.Add(20, {0xFF, 0xFF, 0xFF, 0xFF}, "flash");
    const std::vector<image::Section> expected{{0, {1}}, {4, {4, 5}}, {8, {8, 0xFF, 10}}};
    EXPECT_EQ(KeptBytes(image, contents).Sections(), expected);
}

TEST(FlashMap, TellsWhatALoadDoesToEachPart) {
    std::vector<std::uint8_t> contents(64, 0xFF);
    contents[1] = contents[20] = contents[33] = contents[60] = 0;
    image::Image image;
    image.Add(16, std::vector<std::uint8_t>(4, 0), "image");   // programmed, and 20 cleared
    image.Add(34, std::vector<std::uint8_t>(14, 0), "image");  // there already
    LoadPlan plan;
    plan.sections = {image.Sections()[0]};
    plan.erased = {{16, 31}};
    const FlashGeometry flash{64, 16};
    const auto runs = MapFlash(contents, flash, image, plan);
    using enum MapState;
    const std::vector<MapRun> expected{{{0, 15}, Used},  {{16, 19}, Program}, {{20, 31}, Cleared},
                                       {{32, 33}, Used}, {{34, 47}, Held},    {{48, 63}, Used}};
    EXPECT_EQ(runs, expected);
    EXPECT_EQ(DrawMap(runs, flash, 40)[0], "0x00  #x=#");
    EXPECT_EQ(DrawMap(runs, {64, 1}, 13)[1], "0x08  ########");
    plan.erased.clear();
    contents[17] = 0xFE;
    image = {};
    image.Add(17, {0xFE}, "image");
    plan.sections = image.Sections();
    EXPECT_EQ(MapFlash(contents, flash, image, plan)[2].state, Program);
    image = {};
    image.Add(17, {0xFD}, "image");
    EXPECT_EQ(MapFlash(contents, flash, image, plan)[2], (MapRun{{17, 17}, Blocked}));
}

TEST(Forecast, IsWhatTheLoadWouldFind) {
    std::vector<std::uint8_t> contents(64, 0x0F);
    contents[3] = 0xFE;
    image::Image image;
    image.Add(2, {0x0F, 0xF0}, "image");
    image.Add(16, {0x80}, "image");
    image.Add(31, {0x80}, "image");
    LoadPlan plan;
    plan.sections = image.Sections();
    plan.erased = {{16, 31}};
    const Forecast compared = ForecastLoad(plan, image, contents);
    EXPECT_FALSE(compared.notBlank);
    EXPECT_EQ(compared.differences, Differences{});
    contents[3] = 0xDE;
    EXPECT_EQ(ForecastLoad(plan, image, contents).differences,
              (Differences{1, 1, {{{3, 3}, 0xF0, 0xD0}}, 3, 3}));
    plan.checks.compare = false;
    EXPECT_TRUE(ForecastLoad(plan, image, contents).differences.Empty());
    plan.checks.blankCheck = true;
    EXPECT_EQ(ForecastLoad(plan, image, contents).notBlank.value_or(NotBlank{}).actual, 0x0F);
    plan.sections = {image.Sections()[1]};
    EXPECT_FALSE(ForecastLoad(plan, image, contents).notBlank);
}

TEST(Comparison, JoinsWhatLiesCloseAndKeepsTheFirstRanges) {
    Differences found;
    const std::vector<std::uint8_t> same(5, 0x12);
    Compare(found, 0, same, same);
    EXPECT_TRUE(found.Empty());
    const auto differ = [&](std::uint32_t address, std::uint8_t expected, std::uint8_t actual) {
        Compare(found, address, std::vector<std::uint8_t>{1, expected},
                std::vector<std::uint8_t>{1, actual});
    };
    differ(0x0FF, 0x0F, 0xFF);
    differ(0x10F, 0x03, 0x02);  // 15 equal bytes lie in between
    EXPECT_EQ(found, (Differences{2, 1, {{{0x100, 0x110}, 0x0F, 0xFF}}, 0x110, 0x110}));
    differ(0x120, 0x00, 0x01);  // 16
    EXPECT_EQ(found.ranges.back(), (DifferentRange{{0x121, 0x121}, 0x00, 0x01}));
    for (std::uint32_t i = 2; i < 20; ++i)
        differ(0x1000 * i, 0x00, 0x01);
    EXPECT_EQ(found.rangeCount, 20U);
    EXPECT_EQ(found.ranges.size(), Differences::kRangesShown);
    EXPECT_EQ(found.ranges.back().range.last, 0x7001U);
}

image::Image ImageOf(const std::vector<image::Section>& sections) {
    image::Image image;
    for (const auto& [address, bytes] : sections)
        image.Add(address, bytes, "test");
    return image;
}

TEST(Comparison, ReadsWhatTheImageCoversPieceByPiece) {
    test::FakeFlash flash(0x200000, 0xFF);
    flash.bytes[0x100005] = 0xFE;
    const image::Image image = ImageOf({{0x10, std::vector<std::uint8_t>(2, 0xFF)},
                                        {0x40, std::vector<std::uint8_t>(0x100010, 0xFF)}});
    const Differences expected{1, 1, {{{0x100005, 0x100005}, 0xFF, 0xFE}}, 0x100005, 0x100005};
    EXPECT_EQ(CompareWithFlash(flash, flash.meter, image), expected);
    EXPECT_EQ(flash.log, "halt 10-11 40-10003f 100040-10004f ");
    EXPECT_EQ(flash.Progress(Phase::Verify), "1048594 of 0");
    flash.log.clear();
    EXPECT_EQ(CompareWithErased(flash, flash.meter, {{1, 0x100005}}), expected);
    EXPECT_EQ(flash.log, "halt 1-100000 100001-100005 ");
    EXPECT_FALSE(flash.meter.Running());
    // What has another checksum is read.
    flash.log.clear();
    flash.sumsUp = true;
    Differences bySum = expected;
    bySum.byChecksum = true;
    EXPECT_EQ(CompareWithFlash(flash, flash.meter, image), bySum);
    EXPECT_EQ(flash.log, "halt sum:10 sum:40 40-10003f sum:100040 ");
    EXPECT_EQ(flash.Progress(Phase::Verify), "3145769 of 0");
}

TEST(KeptBytes, AreReadWithTheSectorsOfTheImage) {
    test::FakeFlash flash(0x1000, 0xFF);
    flash.bytes[0x401] = flash.bytes[0x7FE] = flash.bytes[0x800] = 7;
    const image::Image kept = ReadKeptBytes(
        flash, flash.meter, ImageOf({{0x402, std::vector<std::uint8_t>(0x3FC)}}), {0x1000, 0x400});
    EXPECT_EQ(kept, ImageOf({{0x401, {7}}, {0x7FE, {7}}}));
    EXPECT_EQ(flash.log, "halt 400-7ff ");
    EXPECT_EQ(flash.Progress(Phase::Read), "1024 of 1024");
}

TEST(Unchanged, IsReadOnlyWhenASampleHoldsTheImage) {
    const FlashGeometry geometry{0x4000, 0x400};
    const image::Image image = ImageOf({{0x410, std::vector<std::uint8_t>(0x23F0, 0x11)}});
    test::FakeFlash flash(0x4000, 0xFF);
    EXPECT_TRUE(ReadForPlan(flash, flash.meter, image, geometry).contents.Empty());
    EXPECT_EQ(flash.log, "halt 400-47f 2400-247f ");
    flash.log.clear();
    std::fill_n(flash.bytes.begin() + 0x2400, 0x400, std::uint8_t{0x11});
    const image::Image now = ReadForPlan(flash, flash.meter, image, geometry).contents;
    EXPECT_EQ(flash.log, "halt 400-47f 2400-247f 400-27ff ");
    EXPECT_EQ(flash.Progress(Phase::Look), "9216 of 9216");
    // What wasn't read counts as different.
    const std::pair<image::Image, std::vector<base::AddressRange>> cases[] = {
        {now, {{0x2400, 0x27FF}}},
        {{}, {}},
        {ImageOf({{0x2401, std::vector<std::uint8_t>(0x3FF, 0x11)}}), {}},
        {ImageOf({{0x2400, std::vector<std::uint8_t>(0x3FF, 0x11)}}), {}},
        {image, {{0x800, 0x27FF}}},
    };
    for (const auto& [known, unchanged] : cases)
        EXPECT_EQ(Unchanged(image, known, geometry).Ranges(), unchanged);
    flash.log.clear();
    flash.sumsUp = true;
    std::fill_n(flash.bytes.begin() + 0x410, 0x1FF0, std::uint8_t{0x11});
    const FlashNow summed = ReadForPlan(flash, flash.meter, image, geometry);
    EXPECT_TRUE(summed.byChecksum);
    EXPECT_EQ(Unchanged(image, summed.contents, geometry).Bytes(), 0x2400U);
    EXPECT_EQ(flash.log, "halt 400-47f sum:400 ");
}

TEST(Unchanged, IsLeftAloneWhereThatSavesMoreThanALoaderStart) {
    const struct {
        base::AddressRange unchanged;
        bool worth;
    } cases[] = {
        {{0x400, 0x7FF}, true},    // at the beginning of the image
        {{0x2C00, 0x2FFF}, true},  // at its end
        {{0x800, 0x17FF}, false},  // 4 sectors of 20 ms and 2 chunks of 10 ms
        {{0x800, 0x1BFF}, true},   // one more
    };
    for (const auto& [range, worth] : cases) {
        base::AddressSet unchanged;
        base::AddressSet sectors;
        unchanged.Add(range);
        sectors.Add({0x400, 0x2FFF});
        EXPECT_EQ(!WorthLeaving(unchanged, sectors, 0x400).Empty(), worth) << range.last;
    }
    const image::Image image = ImageOf({{0x10, {1, 2, 3, 4, 5, 6}}, {0x20, {7, 8}}});
    base::AddressSet addresses;
    for (const base::AddressRange& range :
         {base::AddressRange{0, 0x10}, {0x12, 0x13}, {0x20, 0x21}})
        addresses.Add(range);
    EXPECT_EQ(Without(image, addresses), ImageOf({{0x11, {2}}, {0x14, {5, 6}}}));
}

}  // namespace
}  // namespace host
