// The host that the plug-in sees, and what is read off the accesses that go by.

#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "host/driver/FlashHost.h"
#include "host/facts/SettingKeys.h"
#include "target/simulated/SimulatedDevice.h"

namespace host {
namespace {

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
    const std::pair<const char*, const char*> cases[] = {
        {"begin 0 100 end return", nullptr},
        {"begin 70 3 end return", nullptr},  // 32-bit arithmetic wraps
        {"begin begin end return", "the plug-in began a progress display while one was open"},
        {"1 return", "the plug-in reported progress without a display"},
        {"begin 101 end", "the plug-in reported progress of 101 %"},
        {"begin end end", "the plug-in ended a progress display that wasn't open"},
        {"begin return", "the plug-in left a progress display open"},
    };
    for (const auto& [steps, breach] : cases) {
        HostUnderTest test;
        testing::internal::CaptureStderr();
        std::istringstream words(steps);
        for (std::string step; words >> step;)
            if (step == "return")
                test.host.CallReturned();
            else
                EXPECT_EQ(step == "begin" ? test.host.BeginProgress("CRC Calculation")
                          : step == "end" ? test.host.EndProgress()
                                          : test.host.UpdateProgress(
                                                static_cast<uint32_t>(std::stoul(step)), "working"),
                          nullptr);
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

}  // namespace
}  // namespace host
