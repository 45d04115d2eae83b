// The settings of a load: read as a request, and written from a plan.

#include <fmt/format.h>
#include <gtest/gtest.h>

#include "host/base/Text.h"
#include "host/flashing/ProgramSettings.h"
#include "tests/support/Cases.h"

namespace host {
namespace {

using namespace std::chrono_literals;

/// Of the settings "KEY=TEXT; KEY=TEXT".
SettingStore Store(const std::string& texts) {
    SettingStore settings;
    for (const std::string& setting : test::Split(texts, "; "))
        if (const auto equals = setting.find('='); equals != setting.npos)
            settings.Set(Origin::UserFile, setting.substr(0, equals), setting.substr(equals + 1));
    return settings;
}

std::string TextOf(const LoadRequest& request) {
    static constexpr const char* kKinds[] = {"necessary", "nothing", "everything", "range"};
    const EraseChoice& erase = request.erase;
    std::string text = kKinds[static_cast<int>(erase.kind)];
    if (erase.kind == EraseChoice::Kind::Range)
        text += fmt::format(" {:x}-{:x}", erase.range.first, erase.range.last);
    if (request.checks.blankCheck) text += ", blank check";
    if (request.checks.checksum) text += ", checksum";
    if (!request.checks.compare) text += ", no comparison";
    return text + fmt::format(", {} s{}", request.time.limit.count(),
                              request.time.chosen ? " chosen" : "");
}

TEST(ProgramSettings, AreReadAsARequest) {
    for (const auto& row : test::ReadTable("host/flashing/requests.txt", 2))
        EXPECT_EQ(TextOf(RequestedLoad(Store(row[0]))), row[1]) << row[0];
}

TEST(ProgramSettings, SayWhatAPlanDoesAndElseStayAsTheyWereWritten) {
    for (const auto& row : test::ReadTable("host/flashing/plans.txt", 4)) {
        SettingStore settings = Store(row[0]);
        const LoadRequest planned = RequestedLoad(Store(row[1]));
        WriteProgramSettings(settings, {.erase = planned.erase,
                                        .checks = planned.checks,
                                        .sectionTime = std::chrono::seconds(std::stoi(row[2]))});
        for (const std::string& text : test::Split(row[3], "; "))
            EXPECT_EQ(settings.Text(text.substr(0, text.find('='))),
                      text.substr(text.find('=') + 1));
        const LoadRequest request = RequestedLoad(settings);
        EXPECT_EQ(request.erase, planned.erase);
        EXPECT_EQ(request.checks, planned.checks);
    }
}

}  // namespace
}  // namespace host
