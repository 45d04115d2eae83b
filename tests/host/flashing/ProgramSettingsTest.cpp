// The settings of a load: read as a request, and written from a plan.

#include <gtest/gtest.h>

#include <map>

#include "host/facts/SettingKeys.h"
#include "host/flashing/ProgramSettings.h"

namespace host {
namespace {

using Kind = EraseChoice::Kind;
using Texts = std::map<std::string, std::string>;
using namespace std::chrono_literals;
using namespace keys;

SettingStore Store(const Texts& texts) {
    SettingStore settings;
    for (const auto& [key, text] : texts)
        settings.Set(Origin::UserFile, key, text);
    return settings;
}

TEST(ProgramSettings, AreReadAsARequest) {
    const struct {
        Texts texts;
        LoadRequest request;
    } cases[] = {
        {{}, {}},
        {{{kProgramOption, kNecessaryPages}}, {}},
        {{{kProgramOption, kNoErase}, {kEraseType, kEntireFlash}}, {.erase = {Kind::Nothing}}},
        {{{kProgramOption, kEraseOptions}, {kEraseType, kEntireFlash}},
         {.erase = {Kind::Everything}}},
        {{{kProgramOption, kEraseOptions},
          {kEraseType, kByAddressRange},
          {kEraseStart, "0x400"},
          {kEraseEnd, "3FF"}},
         {.erase = {Kind::Range, {0x400, 0x3FF}}}},
        {{{kProgramBlankCheck, "1"}}, {.checks = {.blankCheck = true}}},
        {{{kProgramCrc, "1"}}, {.checks = {.checksum = true}}},
        {{{kTimeout, "7"}}, {.time = {7s, true}}},
        {{{kTimeout, "30"}}, {.time = {30s, true}}},
    };
    for (const auto& [texts, expected] : cases) {
        const LoadRequest request = RequestedLoad(Store(texts));
        const std::string name = texts.empty() ? "" : texts.begin()->second;
        EXPECT_EQ(request.erase, expected.erase) << name;
        EXPECT_EQ(request.checks, expected.checks) << name;
        EXPECT_EQ(request.time, expected.time) << name;
    }
}

TEST(ProgramSettings, SayWhatAPlanDoesAndElseStayAsTheyWereWritten) {
    const Texts range{{kProgramOption, kEraseOptions},
                      {kEraseType, kByAddressRange},
                      {kEraseStart, "0x0400"},
                      {kEraseEnd, "7FF"}};
    const Texts on{{kProgramBlankCheck, "1"}, {kProgramCrc, "1"}};
    const struct {
        Texts before;
        EraseChoice erase;
        LoadChecks checks;
        std::chrono::seconds time;
        Texts after;
    } cases[] = {
        {range, {Kind::Range, {0x400, 0x7FF}}, {}, 30s, range},
        {range, {Kind::Range, {0, 0x7FF}}, {}, 30s, {{kEraseStart, "0x0"}, {kEraseEnd, "0x7ff"}}},
        {range, {Kind::Everything}, {}, 30s, {{kEraseType, kEntireFlash}}},
        {range, {Kind::Nothing}, {}, 30s, {{kProgramOption, kNoErase}}},
        {range, {Kind::Necessary}, {}, 30s, {{kProgramOption, kNecessaryPages}}},
        {{},
         {Kind::Everything},
         {},
         30s,
         {{kProgramOption, kEraseOptions}, {kEraseType, kEntireFlash}}},
        {{},
         {},
         {.blankCheck = true, .checksum = true},
         31s,
         {{kProgramBlankCheck, "1"}, {kProgramCrc, "1"}, {kTimeout, "31"}}},
        {on, {}, {}, 30s, {{kProgramBlankCheck, "0"}, {kProgramCrc, "0"}}},
        {{{kTimeout, "5"}}, {}, {}, 5s, {{kTimeout, "5"}}},
    };
    for (const auto& [before, erase, checks, time, after] : cases) {
        SettingStore settings = Store(before);
        WriteProgramSettings(settings, {.erase = erase, .checks = checks, .sectionTime = time});
        for (const auto& [key, text] : after)
            EXPECT_EQ(settings.Text(key), text) << key;
        const LoadRequest request = RequestedLoad(settings);
        EXPECT_EQ(request.erase, erase);
        EXPECT_EQ(request.checks, checks);
    }
}

}  // namespace
}  // namespace host
