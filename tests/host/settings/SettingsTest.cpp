// What settings may hold, where they come from, and where they are kept.

#include <gtest/gtest.h>
#include <stdlib.h>

#include <stdexcept>
#include <utility>
#include <vector>

#include "host/facts/SettingKeys.h"
#include "host/settings/ProjectFile.h"
#include "host/settings/SettingStore.h"
#include "tests/support/FailureOf.h"
#include "tests/support/TemporaryDirectory.h"

namespace host {
namespace {

using test::FailureOf;

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

    const std::pair<const char*, const char*> wrong[] = {
        {"[board.a]\nplugin = 'x'", "line 2: plugin can't stand in a project file"},
        {"[board.a]\ninit = 'x'", "line 2: init can't stand in a project file"},
        {"[board.a]\nsim-file = 'x'", "line 2: sim-file can't stand in a project file"},
        {"[board.a]\npc = '15,init=x'", "line 2: pc takes one value, without a comma"},
        {"[board.a]\nlodaer = 'x'", "line 2: a board has no lodaer; did you mean 'loader'?"},
        {"[board.a]\ngdb = ''", "line 2: gdb is empty"},
        {"[board.a]\ngdb = [1]", "line 2: gdb must be a text between quotes"},
        {"board = 'a'", "line 1: board.NAME is a table"},
        {"default = 'a'", "line 1: there is no [board.a]"},
        {"gdb = ':3'", "line 1: there is no gdb; a project file has default"},
        {"[settings]\nFlashVerboseMode = 'x'", "line 2: FlashVerboseMode can't be 'x'"},
        {"[board.a.settings]\nx = 1", "line 2: unknown setting 'x'"},
        {"not toml", "line 1: "},
    };
    for (const auto& [text, expected] : wrong) {
        directory.Write("corvane-flash.toml", text);
        const std::string failure = FailureOf([&] { ReadProjectFile(path); });
        EXPECT_TRUE(failure.starts_with("3: project file " + path + ": " + expected)) << failure;
    }
}

}  // namespace
}  // namespace host
