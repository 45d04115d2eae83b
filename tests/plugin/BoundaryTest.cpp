// The binary boundary of the built library, and what it makes of the extremes that it can carry.

#include <dlfcn.h>
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <sys/wait.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <locale>
#include <map>

#include "logger/ostrel_logger.h"
#include "tests/support/Cases.h"
#include "tests/support/FailingMemory.h"
#include "tests/support/RecordingHost.h"

namespace {

using test::Plugin;
using test::RecordingHost;
using test::TextOf;

std::string OutputOf(const std::string& command) {
    std::string output;
    std::FILE* pipe = popen(command.c_str(), "r");
    std::array<char, 256> buffer{};
    while (std::fgets(buffer.data(), buffer.size(), pipe) != nullptr)
        output += buffer.data();
    EXPECT_EQ(pclose(pipe), 0) << command;
    return output;
}

TEST(Library, ExportsOneFunction) {
    EXPECT_EQ(OutputOf("nm -D --defined-only --format=just-symbols " FLASH_CORVANE_LIBRARY),
              "CreateFlashDevice2\n");
}

// Seen in a process of its own, started for it, where nobody else has ever held the library.
TEST(Library, IsUnloadedAfterUse) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    const auto loadUseUnload = [] {
        void* library = dlopen(FLASH_CORVANE_LIBRARY, RTLD_NOW | RTLD_LOCAL);
        RecordingHost host("tolva,fail-access=1");
        IFlashDevice2* device = nullptr;
        const auto factory =
            reinterpret_cast<CreateFlashDevice2Function>(dlsym(library, "CreateFlashDevice2"));
        const bool failed = factory("", "", "", &host, &device) != nullptr && device == nullptr;
        const bool created = factory("", "", "", &host, &device) == nullptr;
        device->PerformOperation("nothing");
        device->Destroy();
        dlclose(library);
        const bool gone = dlopen(FLASH_CORVANE_LIBRARY, RTLD_NOW | RTLD_NOLOAD) == nullptr;
        std::_Exit(failed && created && gone ? 0 : 1);
    };
    EXPECT_EXIT(loadUseUnload(), testing::ExitedWithCode(0), "");
}

TEST(Identification, OfEveryClass) {
    for (const auto& row : test::ReadTable("plugin/identified.txt", 5)) {
        SCOPED_TRACE(row[0]);
        RecordingHost host(row[0]);
        Plugin plugin(host);
        bool flash = false;
        const char* operations = nullptr;
        EXPECT_EQ(plugin->Initialize(&flash, &operations), nullptr);
        EXPECT_EQ(flash, row[2] != "0KB");
        const char* const keys[] = {"Family", "FlashSize", "RAMSize", "SectorSize"};
        for (std::size_t i = 0; i < 4; ++i)
            if (i == 0 || !row[i + 1].empty()) {
                EXPECT_EQ(host.settings[std::string("DeviceInfo") + keys[i]], row[i + 1]);
            }
    }
}

TEST(ErrorTexts, StayReadableUntilTheNextFailure) {
    RecordingHost host;
    Plugin plugin(host);
    const std::string longText(100'000, 'x');
    host.fault = {host.calls + 1, 1, longText};
    bool flash = false;
    const char* operations = nullptr;
    const char* kept = plugin->Initialize(&flash, &operations);
    EXPECT_EQ(operations, nullptr);
    EXPECT_EQ(plugin->Initialize(&flash, &operations), nullptr);
    EXPECT_EQ(kept, longText);
}

TEST(ErrorTexts, ComeOutWhenMemoryHasRunOut) {
    RecordingHost host;
    std::vector<std::string> texts;
    for (int allocation = 1; allocation <= 3; ++allocation) {
        Plugin plugin(host);
        OstrelLoggerSetSink(nullptr, nullptr);
        bool within = false;
        test::failingAllocation = allocation;
        const char* text = plugin->AddressWithinFlash(~0ull, &within);
        test::failingAllocation = 0;
        texts.push_back(TextOf(text));
    }
    const std::vector<std::string> expected{"std::bad_alloc", "Out of memory.",
                                            "Address value is too big"};
    EXPECT_EQ(texts, expected);
}

// What a setting's text is taken for shows in what the device is told. The second run is under a
// global locale that groups digits, which must make no difference.
class SettingTexts : public testing::TestWithParam<bool> {
    struct Grouping : std::numpunct<char> {
        char do_thousands_sep() const override { return ','; }
        std::string do_grouping() const override { return "\3"; }
    };

  protected:
    void SetUp() override {
        if (GetParam()) std::locale::global(std::locale(std::locale::classic(), new Grouping));
    }
    void TearDown() override { std::locale::global(std::locale::classic()); }
};

TEST_P(SettingTexts, AreReadInTheirForms) {
    const test::Settings option = {{"FlashProgramOption", "Do Not Erase Flash Memory"}};
    RecordingHost host("dorna,flash=64K,sector=1K", option);
    Plugin plugin(host);
    const unsigned char byte = 0;
    const std::map<std::string, std::function<const char*()>> users = {
        {"FlashUserRegister0Input",
         [&] { return plugin->PerformOperation("ProgramUserRegister0"); }},
        {"FlashResetSetting", [&] { return plugin->ResetSettings(0); }},
        {"FlashVerboseMode", [&] { return plugin->PerformOperation("CalculateChecksum"); }},
        {"FlashTimeoutValue", [&] { return plugin->WriteDataToFlash(&byte, 0, 1, 1); }},
    };
    const test::Settings before = host.settings;
    for (const auto& row : test::ReadTable("plugin/setting-texts.txt", 3)) {
        host.settings = before;
        host.settings[row[0]] = test::Unescaped(row[1]);
        host.Restart({});
        std::string outcome = TextOf(users.at(row[0])());
        if (!host.errors.empty()) outcome += host.errors[0];
        if (row[0] == "FlashUserRegister0Input") outcome += host.messages.at(1);
        EXPECT_EQ(outcome, row[2]) << row[0] << " = " << row[1];
    }
}

INSTANTIATE_TEST_SUITE_P(, SettingTexts, testing::Bool(), [](const auto& grouped) {
    return grouped.param ? "UnderAnOddLocale" : "UnderTheUsualLocale";
});

TEST(Extremes, ErasingTheLargestFlashTakesTimeInProportion) {
    RecordingHost host("quen,flash=128M", {{"FlashEraseEndAddr", "7FFFFFF"}});
    Plugin plugin(host);
    EXPECT_EQ(plugin->PerformOperation("Erase"), nullptr);
    EXPECT_EQ(host.errors, std::vector<std::string>());
    const std::uint64_t first = host.calls;
    EXPECT_GT(first, 131072u * 6);

    // In one load, nothing is erased twice.
    host.settings["FlashProgramOption"] = "Use the Erase Options Specified Below";
    EXPECT_EQ(plugin->WriteDataToFlash(static_cast<const unsigned char*>(nullptr), 0, 0, 1),
              nullptr);
    EXPECT_LT(host.calls - first, 100u);

    // Above 40 MiB the percentage wraps: of 128 MiB, nothing above 31 is ever reported.
    host.transcribe = true;
    EXPECT_EQ(plugin->PerformOperation("BlankCheck"), nullptr);
    EXPECT_GT(std::ranges::count(host.transcript, "update 31 \"Checking...\""), 0);
    EXPECT_EQ(std::ranges::count(host.transcript, "update 32 \"Checking...\""), 0);
}

// Bytes are taken from the caller as they go out, and none from outside the section: the page
// behind cannot be read.
TEST(Extremes, SectionIsReadInPlace) {
    constexpr std::size_t size = 4096;
    void* pages = mmap(nullptr, 2 * size, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    ASSERT_EQ(mprotect(pages, size, PROT_READ), 0);
    const auto* data = static_cast<const unsigned char*>(pages);
    RecordingHost host("tolva", {{"FlashProgramOption", "Do Not Erase Flash Memory"}});
    Plugin plugin(host);
    EXPECT_EQ(plugin->WriteDataToFlash(data + size - 300, 0x1004, 300, 1), nullptr);
    EXPECT_EQ(host.errors, std::vector<std::string>());
    host.settings["FlashTimeoutValue"] = "0";  // ends the work behind the first chunk
    EXPECT_EQ(plugin->WriteDataToFlash(data, 0x1004, 0xFFFFFFFF, 1), nullptr);
    EXPECT_EQ(host.errors.size(), 1u);
    munmap(pages, 2 * size);
}

// A line reaches whoever listens, and nobody is asked for a logger when nobody does.
TEST(Logging, CanBeSwitchedOffAtAnyTime) {
    RecordingHost host;
    Plugin plugin(host);
    OstrelLoggerSetSink(nullptr, nullptr);
    host.transcribe = true;
    bool within = false;
    plugin->AddressWithinFlash(0, &within);
    EXPECT_EQ(host.transcript, std::vector<std::string>());
}

TEST(Logging, SinkMayLogAndTakeItselfAway) {
    static int lines = 0;
    static const auto log = [] { Logging::LoggerFactory::Instance().PlainLine(0, 0, 0, 1, ""); };
    OstrelLoggerSetSink(
        [](void*, int, const char*) {
            if (++lines < 3) log();
            OstrelLoggerSetSink(nullptr, nullptr);
        },
        nullptr);
    log();
    log();
    EXPECT_EQ(lines, 3);
}

}  // namespace
