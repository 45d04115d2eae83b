// What settings may hold, where they come from, and where they are kept.

#include <gtest/gtest.h>
#include <stdlib.h>

#include <stdexcept>
#include <utility>
#include <vector>

#include "host/facts/SettingKeys.h"
#include "host/settings/ProjectFile.h"
#include "host/settings/SettingStore.h"
#include "tests/support/Cases.h"
#include "tests/support/FailureOf.h"
#include "tests/support/TemporaryDirectory.h"

namespace host {
namespace {

using test::FailureOf;

TEST(Settings, TakeWhatThePluginTakesAndNothingElse) {
    for (const auto& row : test::ReadTable("host/settings/texts.txt", 3)) {
        std::string checked = "refused";
        try {
            checked = CheckedText(*FindSetting(row[0]), row[1]);
        } catch (const std::invalid_argument&) {
        }
        EXPECT_EQ(checked, row[2] == "taken" ? row[1] : row[2]) << row[0] << " " << row[1];
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
    const test::TemporaryDirectory directory;
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
    EXPECT_EQ(test::Contents(user), userText);
}

TEST(Settings, FilesThatAreWrongAreNamedWithTheLine) {
    const test::TemporaryDirectory directory;
    for (const auto& row : test::ReadTable("host/settings/wrong.txt", 3)) {
        const std::string path = directory.Write("wrong.toml", test::Unescaped(row[1]));
        const bool project = row[0] == "project";
        const std::string failure = FailureOf(
            [&] { project ? void(ReadProjectFile(path)) : void(LoadSettings(path, {})); });
        EXPECT_EQ(failure.find("3: " + row[0] + " file " + path + ": " + row[2]), 0) << failure;
        EXPECT_EQ(failure.find("delete it"), std::string::npos) << "it is the user's own";
    }
    EXPECT_TRUE(FailureOf([&] { LoadSettings(directory.File("none.toml"), {}); }).starts_with("3"));
}

TEST(Settings, ProjectFilesNameBoardsAndNothingThatIsRunOrWritten) {
    const test::TemporaryDirectory directory;
    const std::string path = directory.Write(
        "corvane-flash.toml",
        "default = 'a'\n[board.a]\ngdb = ':3'\nserver = 'jlink'\nattach = 2\nloader = 'x/l.out'\n"
        "[board.a.settings]\nFlashTimeoutValue = 3\n[board.b]\n"
        "[settings]\nFlashTimeoutValue = 5\nFlashResetSetting = false\n");
    const ProjectFile project = ReadProjectFile(path);
    EXPECT_EQ(project.defaultBoard, "a");
    using Options = decltype(Board::options);
    EXPECT_EQ(project.RequireBoard("a").options, (Options{{"--gdb-option", "attach=2"},
                                                          {"--gdb", ":3"},
                                                          {"--loader", directory.File("x/l.out")},
                                                          {"--gdb-option", "server=jlink"}}));
    EXPECT_EQ(project.RequireBoard("a").settings.at(keys::kTimeout), "3");
    EXPECT_EQ(project.RequireBoard("b").settings.at(keys::kTimeout), "5");
    EXPECT_EQ(project.RequireBoard("b").settings.at(keys::kReset), "0");
    SettingStore store = LoadSettings("/dev/null", {}, {path, project.settings});
    EXPECT_EQ(store.Get(keys::kTimeout), (SettingValue{"5", Origin::Project}));
}

}  // namespace
}  // namespace host
