// The parts of the reference host that need no plug-in: texts, settings, the plan of a load, what
// is drawn, and the checks that the host makes of the plug-in.

#include <fmt/format.h>
#include <gtest/gtest.h>
#include <stdlib.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <random>
#include <sstream>
#include <stdexcept>
#include <thread>

#include "base/Hex.h"
#include "host/base/Errors.h"
#include "host/base/MacAddress.h"
#include "host/driver/FlashHost.h"
#include "host/facts/SettingKeys.h"
#include "host/flashing/Comparison.h"
#include "host/flashing/FlashMap.h"
#include "host/flashing/KeptBytes.h"
#include "host/flashing/LoadPlan.h"
#include "target/simulated/SimulatedDevice.h"

namespace host {
namespace {

namespace fs = std::filesystem;
using namespace std::chrono_literals;

/// A directory of the test's own, gone with it.
class TemporaryDirectory {
  public:
    TemporaryDirectory() {
        std::string name = fs::temp_directory_path() / "host-test-XXXXXX";
        path_ = mkdtemp(name.data());
    }
    ~TemporaryDirectory() { fs::remove_all(path_); }

    std::string File(const std::string& name) const { return path_ / name; }
    std::string Write(const std::string& name, const std::string& contents) const {
        std::ofstream(File(name)) << contents;
        return File(name);
    }

  private:
    fs::path path_;
};

std::string Contents(const std::string& path) {
    std::ostringstream text;
    text << std::ifstream(path).rdbuf();
    return text.str();
}

/// The text of the failure, with its status in front; empty when there was none.
template <typename Action>
std::string FailureOf(Action&& action) try {
    action();
    return "";
} catch (const Failure& failure) {
    return fmt::format("{}: {}", static_cast<int>(failure.Status()), failure.what());
}

TEST(Text, ReadsHexadecimalNumbersWhole) {
    const std::pair<const char*, std::optional<std::uint32_t>> cases[] = {
        {"0", 0},
        {"0x3FFFF", 0x3FFFF},
        {"3ffff", 0x3FFFF},
        {"0XfFfFfFfF", 0xFFFFFFFF},
        {"", {}},
        {"0x", {}},
        {"100000000", {}},
        {"12-34", {}},
        {" 1", {}},
        {"1 ", {}},
        {"-1", {}},
        {"+1", {}},
        {"G1", {}},
        {"0x0x1", {}},
        {"0000000000001", 0x1},
        {"1K", {}},
    };
    for (const auto& [text, expected] : cases)
        EXPECT_EQ(base::ParseHex32(text), expected) << text;
}

TEST(Text, ReadsRangesAndNamesWhatIsWrong) {
    EXPECT_EQ(ParseRange("0x400-7ff"), (base::AddressRange{0x400, 0x7FF}));
    EXPECT_EQ(ParseRange("0-ffffffff").Size(), 0x100000000U);
    const std::pair<const char*, const char*> wrong[] = {
        {"400", "2: '400' is no address range"},
        {"", "2: '' is no address range"},
        {"-400", "2: the range's first address '' is no hexadecimal number"},
        {"0-x", "2: the range's last address 'x' is no hexadecimal number"},
        {"0-1-2", "2: the range's last address '1-2' is no hexadecimal number"},
        {"800-7ff", "2: the range '800-7ff' ends before it starts"},
    };
    for (const auto& [text, expected] : wrong)
        EXPECT_TRUE(FailureOf([range = text] { ParseRange(range); }).starts_with(expected)) << text;
}

TEST(Text, NeverRoundsUpToAThousandOfAUnit) {
    EXPECT_EQ(SizeText(1047552) + SizeText(1048575) + SizeText(1048576), "1023 KiB1.0 MiB1 MiB");
    EXPECT_EQ(DurationText(0.9994) + DurationText(0.9996) + DurationText(59.94),
              "999 ms1.0 s59.9 s");
    EXPECT_EQ(DurationText(59.96) + DurationText(119.6), "1:002:00");
}

TEST(MacAddress, IsReadInAllFormsAndRefusedInNoOther) {
    const std::pair<const char*, const char*> cases[] = {
        {"02-1B-C3-04-05-06", "02-1b-c3-04-05-06"},
        {"02:1b:c3:04:05:06", "02-1b-c3-04-05-06"},
        {"2-1b-c3-4-5-6", "02-1b-c3-04-05-06"},
        {"021BC3040506", "02-1b-c3-04-05-06"},
        {"", nullptr},
        {"21BC3040506", nullptr},
        {"021BC30405063", nullptr},
        {"02-1B-C3-04-05", nullptr},
        {"02-1B-C3-04-05-06-04", nullptr},
        {"02-1B:C3-04-05-06", nullptr},
        {"02--1B-C3-04-05-03", nullptr},
        {"02-1B-C3-04-05-06-", nullptr},
        {"002-1B-C3-04-05-06", nullptr},
        {"0G-1B-C3-04-05-06", nullptr},
    };
    for (const auto& [text, expected] : cases) {
        const auto mac = ParseMacAddress(text);
        EXPECT_EQ(mac ? mac->Text() : "refused", expected ? expected : "refused") << text;
    }
    const MacAddress mac = *ParseMacAddress("02-1B-C3-04-05-06");
    EXPECT_EQ(mac.Register(0), 0x00C31B02U);
    EXPECT_EQ(mac.Register(1), 0x00060504U);
    EXPECT_EQ(mac.Objection(), "");
    for (const char* text : {"000000000000", "ffffffffffff", "03-1b-c3-04-05-06"})
        EXPECT_NE(ParseMacAddress(text)->Objection(), "") << text;
}

TEST(Settings, TakeWhatThePluginTakesAndNothingElse) {
    const struct {
        const char* key;
        std::vector<const char*> accepted;
        std::vector<const char*> refused;
    } cases[] = {
        {keys::kReset, {"0", "1"}, {"", "2", "-1", "true", " 1", "10", "+1", "01"}},
        {keys::kVerbose,
         {"0", "-1", "2147483647", "-2147483648"},
         {"", "x", "1.0", " 1", "2147483648", "+", "+7"}},
        {keys::kTimeout,
         {"30", "1"},
         {"", "s", "30s", "2147483648", "0x10", "-1", "0", "1.5", "1e3"}},
        {keys::kEraseStart, {"0", "0x3FFFF", "ffffffff"}, {"", "xyz", "12-34", "100000000"}},
        {keys::kEraseType, {"Entire Flash", "By Address Range"}, {"entire flash", "", "x"}},
        {keys::kChecksumValue, {}, {"", "--", "ffff"}},
    };
    for (const auto& [key, accepted, refused] : cases) {
        const SettingInfo& info = *FindSetting(key);
        for (const char* text : accepted)
            EXPECT_EQ(CheckedText(info, text), text) << key;
        for (const char* text : refused)
            EXPECT_THROW(CheckedText(info, text), std::invalid_argument) << key << " " << text;
    }
    for (const SettingInfo& info : SettingCatalogue()) {
        if (info.form == SettingForm::Published) continue;
        EXPECT_EQ(CheckedText(info, info.defaultText), info.defaultText) << info.key;
    }
}

TEST(Settings, ComeFromTheStrongestLayerThatHasThem) {
    constexpr Origin origins[] = {Origin::CommandLine, Origin::Environment, Origin::UserFile,
                                  Origin::Kept};
    for (unsigned layers = 0; layers < 16; ++layers) {
        SettingStore store;
        SettingValue expected{"30", Origin::Default};
        for (unsigned i = 4; i-- > 0;) {
            if ((layers >> i & 1) == 0) continue;
            expected = {std::to_string(i), origins[i]};
            store.Set(origins[i], keys::kTimeout, expected.text);
        }
        EXPECT_EQ(store.Get(keys::kTimeout), expected) << layers;
    }
}

TEST(Settings, AreReadFromEverywhereAndKeptBesideTheUsersFile) {
    const TemporaryDirectory directory;
    const std::string userText =
        "FlashTimeoutValue = 7\nFlashEraseEndAddr = 0x3FFFF\n"
        "FlashResetSetting = false\nFlashMACAddrInput = '021BC3040506'\n";
    const std::string user = directory.Write("mine.toml", userText);
    setenv("CORVANE_SET_FlashCrystalFreq", "10", 1);
    SettingStore store = LoadSettings(user, {"FlashVerboseMode=1", "FlashEraseType=Entire Flash"});
    unsetenv("CORVANE_SET_FlashCrystalFreq");
    const std::pair<const char*, SettingValue> expected[] = {
        {keys::kTimeout, {"7", Origin::UserFile}},
        {keys::kEraseEnd, {"3ffff", Origin::UserFile}},
        {keys::kReset, {"0", Origin::UserFile}},
        {keys::kMacInput, {"02-1b-c3-04-05-06", Origin::UserFile}},
        {keys::kCrystalFreq, {"10", Origin::Environment}},
        {keys::kVerbose, {"1", Origin::CommandLine}},
        {keys::kEraseType, {"Entire Flash", Origin::CommandLine}},
        {keys::kEraseStart, {"0", Origin::Default}},
    };
    for (const auto& [key, value] : expected)
        EXPECT_EQ(store.Get(key), value) << key;

    // Two runs at once keep different things; neither loses the other's.
    SettingStore other = LoadSettings(user, {});
    store.Publish(keys::kMacInput, "2-1b-c3-4-5-7");  // of this board alone
    EXPECT_EQ(store.Published(keys::kMacInput), "02-1b-c3-04-05-07");
    store.Publish(keys::kFamily, "a \"family\"\n");
    store.Keep("Of a later plug-in", "x");
    store.Save([](const std::string&) {});
    other.Keep(keys::kChecksumValue, "abcd");
    other.Save([](const std::string&) {});
    SettingStore again = LoadSettings(user, {});
    EXPECT_EQ(again.Published(keys::kFamily) + again.Kept(keys::kMacInput), "");
    EXPECT_EQ(again.Text(keys::kMacInput), "02-1b-c3-04-05-06");
    EXPECT_EQ(again.Text(keys::kFamily), "a \"family\"\n");
    EXPECT_EQ(again.Text("Of a later plug-in"), "x");
    again.Forget(keys::kFamily);
    again.Save([](const std::string&) {});
    again = LoadSettings(user, {});
    EXPECT_EQ(again.Text(keys::kFamily) + again.Text(keys::kChecksumValue), "abcd");
    EXPECT_EQ(Contents(user), userText);
}

TEST(Settings, FilesThatAreWrongAreNamedWithTheLine) {
    const TemporaryDirectory directory;
    const std::pair<const char*, const char*> cases[] = {
        {"FlashTimeoutValue = \"x\"", "line 1: FlashTimeoutValue can't be 'x'"},
        {"\nFlashNonsense = \"1\"", "line 2: unknown setting 'FlashNonsense'"},
        {"FlashEraseEndAddr = 20000", "line 1: FlashEraseEndAddr must be a text between quotes"},
        {"FlashEraseEndAddr = [1]", "line 1: FlashEraseEndAddr must be a text between quotes"},
        {"FlashVerboseMode = 1\nFlashVerboseMode = 2", "line 2: "},
        {"DeviceInfoFamily = \"x\"", "only the plug-in writes it"},
        {"not toml", "line 1: "},
    };
    for (const auto& [text, expected] : cases) {
        const std::string path = directory.Write("wrong.toml", text);
        const std::string failure = FailureOf([&] { LoadSettings(path, {}); });
        EXPECT_TRUE(failure.starts_with("3: settings file " + path)) << failure;
        EXPECT_NE(failure.find(expected), std::string::npos) << failure;
        EXPECT_EQ(failure.find("delete it"), std::string::npos) << "it is the user's own";
    }
    EXPECT_TRUE(FailureOf([&] { LoadSettings(directory.File("none.toml"), {}); }).starts_with("3"));
}

image::Section Bytes(std::uint32_t address, std::size_t count, std::uint8_t value) {
    return {address, std::vector<std::uint8_t>(count, value)};
}

image::Section Joined(image::Section section, const std::vector<image::Section>& more) {
    for (const image::Section& next : more) {
        section.bytes.resize(next.address - section.address, 0xFF);
        section.bytes.insert(section.bytes.end(), next.bytes.begin(), next.bytes.end());
    }
    return section;
}

TEST(LoadPlan, ErasesJoinsAndCounts) {
    using Kind = EraseChoice::Kind;
    const FlashGeometry flash{0x10000, 0x400};
    const image::Section a = Bytes(0x10, 0x20, 1);   // sector 0
    const image::Section b = Bytes(0x600, 0x10, 2);  // sector 1, behind a short gap
    const image::Section c =
        Bytes(0x1000, 0x801, 3);  // sectors 4 to 6, behind a gap of more than one chunk
    const struct {
        EraseChoice erase;
        LoadPlan expected;
    } cases[] = {
        {{Kind::Necessary, {}},
         {{Joined(a, {b}), c},
          {{0, 0x7FF}, {0x1000, 0x1BFF}},
          0x1400,
          5,
          0x831,
          0xF00,
          0xBCF,
          {Kind::Necessary}}},
        {{Kind::Nothing, {}}, {{a, b, c}, {}, 0, 0, 0x831, 0x980, 0, {Kind::Nothing}}},
        {{Kind::Everything, {}},
         {{Joined(a, {b}), c},
          {{0, 0xFFFF}},
          0x10000,
          64,
          0x831,
          0xF00,
          0xF7CF,
          {Kind::Everything}}},
        {{Kind::Range, {0x3FF, 0x400}},
         {{Joined(a, {b}), c},
          {{0, 0x7FF}},
          0x800,
          2,
          0x831,
          0xF00,
          0x7D0,
          {Kind::Range, {0x3FF, 0x400}}}},
        {{Kind::Range, {0x5FF, 0x600}},
         {{a, b, c},
          {{0x400, 0x7FF}},
          0x400,
          1,
          0x831,
          0x980,
          0x3F0,
          {Kind::Range, {0x5FF, 0x600}}}},
        {{Kind::Range, {2, 1}}, {{a, b, c}, {}, 0, 0, 0x831, 0x980, 0, {Kind::Range, {2, 1}}}},
    };
    image::Image image;
    for (const image::Section& section : {a, b, c})
        image.Add(section.address, section.bytes, "test");
    for (const auto& [erase, expected] : cases) {
        EXPECT_EQ(PlanLoad({.erase = erase, .time = {0s, true}}, image, {}, flash), expected)
            << static_cast<int>(erase.kind) << " " << RangeText(erase.range);
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

TEST(Progress, FitsEveryTerminal) {
    const PhaseProgress half{5 * 1024, 10 * 1024, 2.0};
    EXPECT_EQ(BarLine(Phase::Program, half, 79),
              "Programming  [#####.....]  50 %  5 KiB of 10 KiB  2.0 s left  2.5 KiB/s");
    EXPECT_EQ(BarLine(Phase::Program, half, 40), "Programming   50 %  5 KiB of 10 KiB");
    EXPECT_EQ(BarLine(Phase::Program, half, 20), "Programming   50 %");
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

/// A host over a simulated device, with what it says on standard error kept off the screen.
struct HostUnderTest {
    explicit HostUnderTest(const std::string& device = "tolva")
        : target(target::ParseDeviceOptions(device)) {}

    target::SimulatedDevice target;
    SettingStore settings;
    Reporter reporter{Reporter::Options{Verbosity::Quiet, false, "none"}};
    WorkMeter meter{reporter};
    FlashWatch watch{meter};
    FlashHost host{target, settings, reporter, watch, "dir/"};
};

TEST(FlashHost, HoldsThePluginToTheProgressProtocol) {
    using Steps = std::vector<std::function<const char*(FlashHost&)>>;
    const auto begin = [](FlashHost& host) { return host.BeginProgress("CRC Calculation"); };
    const auto end = [](FlashHost& host) { return host.EndProgress(); };
    const auto returns = [](FlashHost& host) {
        host.CallReturned();
        return static_cast<const char*>(nullptr);
    };
    const auto percent = [](std::uint32_t value) {
        return [=](FlashHost& host) { return host.UpdateProgress(value, "working"); };
    };
    const std::pair<Steps, const char*> cases[] = {
        {{begin, percent(0), percent(100), end, returns}, nullptr},
        {{begin, percent(70), percent(3), end, returns}, nullptr},  // 32-bit arithmetic wraps
        {{begin, begin, end, returns}, "the plug-in began a progress display while one was open"},
        {{percent(1), returns}, "the plug-in reported progress without a display"},
        {{begin, percent(101), end}, "the plug-in reported progress of 101 %"},
        {{begin, end, end}, "the plug-in ended a progress display that wasn't open"},
        {{begin, returns}, "the plug-in left a progress display open"},
    };
    for (const auto& [steps, breach] : cases) {
        HostUnderTest test;
        testing::internal::CaptureStderr();
        for (const auto& step : steps)
            EXPECT_EQ(step(test.host), nullptr);
        testing::internal::GetCapturedStderr();
        EXPECT_EQ(test.host.Errors(),
                  breach ? std::vector<std::string>{breach} : std::vector<std::string>{});
    }
}

TEST(FlashHost, AnswersInsteadOfThrowing) {
    HostUnderTest test("tolva,fail-access=1");
    std::uint32_t word = 0;
    EXPECT_NE(std::string(test.host.ReadMemory(&word, 1, 0x400FE000, 1, 4)).find("access 1"),
              std::string::npos);
    EXPECT_EQ(test.host.ReadMemory(&word, 1, 0x400FE000, 1, 4), nullptr);
    EXPECT_STREQ(test.host.ReadMemory(&word, 1, 0x100000000, 1, 4),
                 "address 0x100000000 lies beyond 32 bits");
    EXPECT_EQ(test.host.GetProperty("FlashNonsense"), nullptr);
    EXPECT_STREQ(test.host.GetProperty(keys::kTimeout), "30");
    EXPECT_EQ(test.host.SetProperty("Something new", "x"), nullptr);
}

TEST(AddressSet, JoinsWhatOverlapsOrTouches) {
    base::AddressSet set;
    for (const base::AddressRange& range : {base::AddressRange{0x40, 0x4F},
                                            {0x80, 0x8F},
                                            {0x10, 0x1F},
                                            {0x20, 0x2F},
                                            {0x48, 0x58},
                                            {0xFFFFFFF0, 0xFFFFFFFF}})
        set.Add(range);
    EXPECT_EQ(set.Ranges(),
              (std::vector<base::AddressRange>{
                  {0x10, 0x2F}, {0x40, 0x58}, {0x80, 0x8F}, {0xFFFFFFF0, 0xFFFFFFFF}}));
    EXPECT_EQ(set.BytesIn({0x2F, 0x80}), 0x1BU);
    set.Add({0x18, 0xFFFFFFFF});
    EXPECT_EQ(set.Bytes(), 0xFFFFFFF0U);
}

TEST(FlashWatch, CountsAnEraseWhenTheDeviceSaysItIsDone) {
    HostUnderTest test;
    test.watch.SetGeometry(0x40000, 0x400);
    const std::uint32_t erase = 0xA4420002;
    const std::uint8_t busy[4] = {2};
    const std::uint8_t idle[4] = {0};
    test.watch.Writing(0x400FD000, 0x800);
    test.watch.Writing(0x400FD008, erase);
    EXPECT_EQ(test.watch.Work().attempted.Ranges(),
              (std::vector<base::AddressRange>{{0x800, 0xBFF}}));
    EXPECT_TRUE(test.watch.Work().erased.Empty());
    test.watch.Read(0x400FD008, 4, busy);
    EXPECT_EQ(test.meter.Phases()[Phase::Erase].doneBytes, 0U);
    test.watch.Read(0x400FD008, 4, idle);
    test.watch.Read(0x400FD008, 4, idle);
    EXPECT_EQ(test.meter.Phases()[Phase::Erase].doneBytes, 0x400U);
    test.watch.Writing(0x400FD008, 0xA4420004);
    test.watch.Read(0x400FD008, 4, idle);
    EXPECT_EQ(test.meter.Phases()[Phase::Erase].doneBytes, 0x40400U);
}

TEST(WorkMeter, GivesEachPhaseTheTimeInWhichItIsTheCurrentOne) {
    using Seconds = std::chrono::duration<double>;
    HostUnderTest test;
    const auto start = std::chrono::steady_clock::now();
    test.meter.Begin(Phase::Read);
    std::this_thread::sleep_for(4ms);
    test.meter.Begin(Phase::Verify);
    std::this_thread::sleep_for(2ms);
    test.meter.End();
    const Seconds elapsed = std::chrono::steady_clock::now() - start;
    std::this_thread::sleep_for(2ms);
    test.meter.End();
    const double read = test.meter.Phases()[Phase::Read].seconds;
    const double verified = test.meter.Phases()[Phase::Verify].seconds;
    EXPECT_GE(read, 0.004);
    EXPECT_GE(verified, 0.002);
    EXPECT_LE(read + verified, elapsed.count());
}

}  // namespace
}  // namespace host
