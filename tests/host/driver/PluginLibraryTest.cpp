// Which library is loaded, and what is said of one that can't be.

#include <gtest/gtest.h>

#include <filesystem>
#include <utility>

#include "host/driver/PluginLibrary.h"
#include "tests/support/FailureOf.h"
#include "tests/support/TemporaryDirectory.h"

namespace host {
namespace {

TEST(PluginLibrary, IsLoadedByItsPath) {
    const PluginLibrary library(FLASH_CORVANE_LIBRARY);
    EXPECT_NE(library.CreateDevice(), nullptr);
    EXPECT_NE(library.Library().Find("CreateFlashDevice2"), nullptr);
    EXPECT_EQ(library.Path(), FLASH_CORVANE_LIBRARY);
    EXPECT_EQ(PluginFile("here.so"), "./here.so");
    EXPECT_EQ(PluginFile("some/where.so"), "some/where.so");
    EXPECT_EQ(PluginFile(""), std::filesystem::path(FLASH_CORVANE_LIBRARY));
}

TEST(PluginLibrary, IsRefusedWithTheReason) {
    const test::TemporaryDirectory directory;
    const std::string whole = test::Contents(FLASH_CORVANE_LIBRARY);
    const std::pair<std::string, std::string> cases[] = {
        {directory.File("none.so"), "cannot open shared object file"},
        {directory.Path(), " is no regular file; name another one with --plugin"},
        {directory.Write("text.so", "no library"), "file too short"},
        {directory.Write("header.so", whole.substr(0, 100)), " is cut short; name another one"},
        {directory.Write("start.so", whole.substr(0, 5000)), " is cut short; name another one"},
        {OSTREL_LOGGER_LIBRARY, " is no flash plug-in: it exports no CreateFlashDevice2"},
    };
    for (const auto& [file, reason] : cases) {
        const std::string failure = test::FailureOf([&path = file] { PluginLibrary{path}; });
        EXPECT_TRUE(failure.starts_with("4: ")) << failure;
        EXPECT_NE(failure.find(reason), std::string::npos) << failure;
        EXPECT_NE(failure.find(file), std::string::npos) << failure;
    }
}

}  // namespace
}  // namespace host
