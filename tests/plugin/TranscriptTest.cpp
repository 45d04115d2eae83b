// Whole transcripts, host calls and trace lines interleaved, of what the order matters in. They
// are compared with the files in tests/plugin/transcripts; run with CORVANE_WRITE_TRANSCRIPTS=1 to
// write these anew, and read every changed line before you keep it: boards depend on them.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdlib>
#include <fstream>
#include <numeric>
#include <sstream>

#include "tests/support/RecordingHost.h"

namespace {

using test::Plugin;
using test::RecordingHost;

struct Scenario {
    const char* name;
    const char* device;
    test::Settings settings;
    void (*run)(RecordingHost&, Plugin&);
};

void PrintTo(const Scenario& scenario, std::ostream* out) {
    *out << scenario.name;
}

// Notes what a call returned, so that the transcript shows it.
void Returned(RecordingHost& host, const std::string& call, const char* error) {
    host.transcript.push_back(call +
                              (error == nullptr ? " done" : " failed: " + std::string(error)));
}

void Load(RecordingHost& host, Plugin& plugin, std::uint32_t address, std::uint32_t length) {
    static std::vector<std::uint8_t> bytes(8192);
    std::iota(bytes.begin(), bytes.end(), std::uint8_t{1});
    host.data = bytes.data();
    Returned(host, "WriteDataToFlash", plugin->WriteDataToFlash(bytes.data(), address, length, 1));
}

template <int Mode>
void Reset(RecordingHost& host, Plugin& plugin) {
    Returned(host, "ResetSettings", plugin->ResetSettings(Mode));
}

void Perform(RecordingHost& host, Plugin& plugin, const char* name) {
    Returned(host, "PerformOperation", plugin->PerformOperation(name));
}

// Replaces thousands of equal lines by how many they were.
void CountLines(RecordingHost& host, const std::string& line) {
    const auto count = std::erase(host.transcript, line);
    host.transcript.push_back(std::to_string(count) + " times: " + line);
}

// The same on other devices, each with the settings of the first; the time that passed is noted.
void OnDevices(RecordingHost& host, std::initializer_list<const char*> devices,
               void (*run)(RecordingHost&, Plugin&)) {
    for (const char* device : devices) {
        host.transcript.emplace_back(device);
        RecordingHost other(device, host.settings);
        Plugin plugin(other);
        other.transcribe = true;
        const auto start = test::VirtualNow();
        run(other, plugin);
        std::ranges::move(other.transcript, std::back_inserter(host.transcript));
        const auto passed =
            std::chrono::round<std::chrono::milliseconds>(test::VirtualNow() - start);
        host.transcript.push_back(std::to_string(passed.count()) + " ms");
    }
}

void CheckRange(RecordingHost& host, Plugin& plugin, const char* name, const char* start,
                const char* end) {
    for (const char* prefix : {"FlashBlankCheck", "FlashChecksum"}) {
        host.settings[std::string(prefix) + "Selection"] = "By Address Range";
        host.settings[std::string(prefix) + "StartAddr"] = start;
        host.settings[std::string(prefix) + "EndAddr"] = end;
    }
    Perform(host, plugin, name);
}

const Scenario Scenarios[] = {
    {"initialize",
     "tolva,revision=B,flash=256K,ram=64K",
     {},
     [](RecordingHost& host, Plugin& plugin) {
         bool flash = false;
         const char* operations = nullptr;
         Returned(host, "Initialize", plugin->Initialize(&flash, &operations));
         host.transcript.push_back(std::string(flash ? "flash, " : "no flash, ") + operations);
         bool within = false;
         Returned(host, "AddressWithinFlash", plugin->AddressWithinFlash(0x3FFFF, &within));
         Returned(host, "AddressWithinFlash", plugin->AddressWithinFlash(0, -1, &within));
         Returned(host, "special region", plugin->AddressWithinSpecialRegion(0, &within));
         for (const char* device : {"dorna,id=0x801A0000", "quen"}) {
             RecordingHost other(device);
             other.transcribe = true;
             const Plugin created(other);
             std::ranges::move(other.transcript, std::back_inserter(host.transcript));
         }
     }},
    // What belongs to a load and what is left of it: a reset of the target is allowed once, an
    // erase is made once, and mode 4 keeps it. The clock begins with none of its bits set.
    {"load-state",
     "tolva,revision=A,flash=64K",
     {{"FlashProgramOption", "Use the Erase Options Specified Below"},
      {"FlashEraseType", "Entire Flash"},
      {"FlashResetSetting", "0"}},
     [](RecordingHost& host, Plugin& plugin) {
         const std::uint32_t clock = 0;
         host.Device().Write(&clock, 1, 0x400FE060, 1, 4);
         host.settings.erase("FlashCrystalFreq");
         Load(host, plugin, 0, 0);
         host.settings["FlashResetSetting"] = "1";
         host.settings["FlashCrystalFreq"] = "zz";
         Load(host, plugin, 0, 0);
         Reset<4>(host, plugin);
         Load(host, plugin, 0, 0);
         Reset<0>(host, plugin);
         host.settings["FlashEraseType"] = "none";  // fails, and is tried again
         Load(host, plugin, 0, 0);
         host.settings["FlashEraseType"] = "Entire Flash";
         Load(host, plugin, 0, 0);
     }},
    {"erase-whole-by-class",
     "tolva",
     {{"FlashEraseType", "Entire Flash"}, {"FlashResetSetting", "0"}},
     [](RecordingHost& host, Plugin&) {
         OnDevices(host,
                   {"mesk,flash=64K", "mesk,flash=128K", "ravik,flash=128K", "ravik,id=0x00020000",
                    "tolva,id=0x00010200", "orrin,id=0x10040102", "pell,keyconfig=0xFFFFFFEF",
                    "quen,keyconfig=0", "dorna,keyconfig=0xFFFFFFFF"},
                   [](RecordingHost& other, Plugin& plugin) { Perform(other, plugin, "Erase"); });
     }},
    // A commit of 5 s is waited for, and a loader as many polls as fit into the time-out.
    {"time-limits",
     "tolva",
     {{"FlashProgramOption", "Do Not Erase Flash Memory"}, {"FlashTimeoutValue", "20"}},
     [](RecordingHost& host, Plugin&) {
         OnDevices(host, {"mesk,commit-time=4s", "mesk,commit-time=6s"},
                   [](RecordingHost& other, Plugin& plugin) {
                       Perform(other, plugin, "ProgramUserRegister1");
                       CountLines(other, "read 1x4 0x400FD008 page 1 = 0x00000008");
                   });
         OnDevices(host, {"orrin,loader=hangs"}, [](RecordingHost& other, Plugin& plugin) {
             Load(other, plugin, 0, 4096);
             CountLines(other, "read 1x4 0x2000100C page 1 = 0xFFFFFFFF");
         });
     }},
    // Two sections share a sector; partial blocks at both ends; verbose; reset once only.
    {"load-necessary-pages",
     "tolva,revision=B,flash=256K",
     {{"FlashVerboseMode", "1"}},
     [](RecordingHost& host, Plugin& plugin) {
         Reset<0>(host, plugin);
         Load(host, plugin, 0x1004, 8);
         Load(host, plugin, 0x13FE, 5000);
         Load(host, plugin, 0xBFE, 8);
         Load(host, plugin, 0x1900, 8);  // erased already
     }},
    {"load-erase-whole-and-check",
     "mesk,flash=96K",
     {{"FlashProgramOption", "Use the Erase Options Specified Below"},
      {"FlashEraseType", "Entire Flash"},
      {"FlashProgramBlankCheckOption", "1"},
      {"FlashVerboseMode", "1"},
      {"FlashResetSetting", "0"},
      {"FlashCrystalFreq", "10"}},
     [](RecordingHost& host, Plugin& plugin) {
         Load(host, plugin, 0, 128);
         Load(host, plugin, 0x40, 1);  // not blank any more
     }},
    {"load-without-erase",
     "orrin",
     {{"FlashProgramOption", "Do Not Erase Flash Memory"}},
     [](RecordingHost& host, Plugin& plugin) {
         const std::uint32_t clock2 = ~0U;
         host.Device().Write(&clock2, 1, 0x400FE070, 1, 4);
         Load(host, plugin, 0x800, 0);
         host.settings.erase("FlashProgramOption");  // no longer asked for
         Load(host, plugin, 0x800, 2048);
         host.settings["FlashTimeoutValue"] = "0";
         Load(host, plugin, 0x1000, 1);
         host.settings["FlashTimeoutValue"] = "s5";
         Load(host, plugin, 0x1000, 1);
     }},
    // Past the end of the address space, addresses go on from 0. Nobody asks whether it is flash.
    {"load-wrapping-range",
     "orrin",
     {{"FlashProgramOption", "Do Not Erase Flash Memory"}},
     [](RecordingHost& host, Plugin& plugin) { Load(host, plugin, 0xFFFFFF80, 0xA0); }},
    // Chunks that take the loader longer than one poll, and a budget that runs out.
    {"load-slow-loader",
     "dorna,chunk-time=150ms",
     {{"FlashTimeoutValue", "1"}},
     [](RecordingHost& host, Plugin& plugin) { Load(host, plugin, 0x2000, 8192); }},
    {"erase-whole-large",
     "quen,flash=256K,keyconfig=0xFFFFFFEF",
     {{"FlashEraseType", "Entire Flash"}, {"FlashVerboseMode", "-1"}},
     [](RecordingHost& host, Plugin& plugin) { Perform(host, plugin, "Erase"); }},
    {"erase-whole-mesk-32k",
     "mesk,flash=32K",
     {{"FlashEraseType", "Entire Flash"}},
     [](RecordingHost& host, Plugin& plugin) { Perform(host, plugin, "Erase"); }},
    {"erase-whole-mesk-unsupported",
     "mesk,flash=256K",
     {{"FlashEraseType", "Entire Flash"}},
     [](RecordingHost& host, Plugin& plugin) { Perform(host, plugin, "Erase"); }},
    {"erase-range",
     "pell,flash=64K",
     {{"FlashEraseStartAddr", "0x7FF"}, {"FlashEraseEndAddr", "800"}, {"FlashVerboseMode", "1"}},
     [](RecordingHost& host, Plugin& plugin) {
         Perform(host, plugin, "Erase");
         host.settings["FlashEraseEndAddr"] = "10000";  // the first address behind
         Perform(host, plugin, "Erase");
         host.settings["FlashEraseEndAddr"] = "7FE";  // before the start, in the same sector
         Perform(host, plugin, "Erase");
         host.settings["FlashEraseStartAddr"] = "10000";
         Perform(host, plugin, "Erase");
         host.settings["FlashEraseType"] = "entire flash";
         Perform(host, plugin, "Erase");
         host.settings.erase("FlashEraseType");
         Perform(host, plugin, "Erase");
     }},
    {"erase-display-does-not-end",
     "pell",
     {{"FlashEraseType", "none"}, {"FlashResetSetting", "0"}},
     [](RecordingHost& host, Plugin& plugin) {
         host.failNext = "end";
         Perform(host, plugin, "Erase");
         host.failNext = "get FlashEraseType";
         Perform(host, plugin, "Erase");
         host.fault = {host.calls + 7, 3, "injected failure"};  // the setting and all after it
         Perform(host, plugin, "Erase");
     }},
    {"erase-never-ends",
     "quen,erase=never",
     {{"FlashEraseType", "Entire Flash"}, {"FlashResetSetting", "0"}},
     [](RecordingHost& host, Plugin& plugin) {
         Perform(host, plugin, "Erase");
         CountLines(host, "read 1x4 0x400FD008 page 1 = 0x00000004");
         CountLines(host, "sleep 10");
     }},
    {"erase-of-a-sector-never-ends",
     "quen,erase=never",
     {{"FlashEraseStartAddr", "400"}, {"FlashEraseEndAddr", "1000"}, {"FlashResetSetting", "0"}},
     [](RecordingHost& host, Plugin& plugin) {
         Perform(host, plugin, "Erase");
         CountLines(host, "read 1x4 0x400FD008 page 1 = 0x00000002");
         CountLines(host, "sleep 5");
     }},
    {"blank-check",
     "dorna,flash=64K",
     {{"FlashVerboseMode", "1"}},
     [](RecordingHost& host, Plugin& plugin) {
         Perform(host, plugin, "BlankCheck");
         host.Device().Flash().Preset(32752, std::array<std::uint8_t, 1>{0x00});
         Perform(host, plugin, "BlankCheck");
         host.settings["FlashBlankCheckSelection"] = "By Address Range";
         host.settings["FlashBlankCheckStartAddr"] = "5";
         host.settings["FlashBlankCheckEndAddr"] = "0x5";
         Perform(host, plugin, "BlankCheck");
         host.settings["FlashBlankCheckStartAddr"] = "6";
         Perform(host, plugin, "BlankCheck");
         host.settings["FlashBlankCheckSelection"] = "";
         Perform(host, plugin, "BlankCheck");

         // Chunks of 8 bytes: all programmed, the last one, every other one behind a whole chunk.
         auto& flash = host.Device().Flash();
         flash.Preset(0x100, std::array<std::uint8_t, 8>{});
         flash.Preset(0x207, std::array<std::uint8_t, 1>{0x7F});
         for (std::uint32_t odd = 0xFFE5; odd < 0xFFEC; odd += 2)
             flash.Preset(odd, std::array<std::uint8_t, 1>{0xFE});
         CheckRange(host, plugin, "BlankCheck", "100", "107");
         CheckRange(host, plugin, "BlankCheck", "200", "207");
         CheckRange(host, plugin, "BlankCheck", "7FF4", "FFEB");
         CheckRange(host, plugin, "BlankCheck", "7", "8");
         CheckRange(host, plugin, "BlankCheck", "FFF0", "10000");
         CheckRange(host, plugin, "CalculateChecksum", "FFF0", "10000");
         host.failNext = "read";
         CheckRange(host, plugin, "BlankCheck", "0", "0");
         host.settings.erase("FlashBlankCheckSelection");
         Perform(host, plugin, "BlankCheck");
     }},
    {"checksum",
     "dorna,flash=64K",
     {{"FlashVerboseMode", "1"}},
     [](RecordingHost& host, Plugin& plugin) {
         Perform(host, plugin, "CalculateChecksum");
         host.failNext = "read";
         Perform(host, plugin, "CalculateChecksum");
         host.settings["FlashChecksumSelection"] = "By Address Range";
         host.settings["FlashChecksumEndAddr"] = "0xffff";
         host.failNext = "set";
         Perform(host, plugin, "CalculateChecksum");
         host.settings["FlashChecksumStartAddr"] = "10000";
         Perform(host, plugin, "CalculateChecksum");
         host.settings["FlashChecksumSelection"] = "None";
         Perform(host, plugin, "CalculateChecksum");
         host.settings.erase("FlashChecksumSelection");
         Perform(host, plugin, "CalculateChecksum");
     }},
    {"settings-reset",
     "tolva",
     {{"FlashResetSetting", "1"}, {"FlashProgramCRCOption", "1"}},
     [](RecordingHost& host, Plugin& plugin) {
         Reset<1>(host, plugin);
         Reset<2>(host, plugin);
         Reset<4>(host, plugin);
         host.settings["FlashResetSetting"] = "true";
         Reset<0>(host, plugin);
         host.settings["FlashResetSetting"] = "0";
         OnDevices(host, {"quen"}, Reset<1>);
         host.settings["FlashResetSetting"] = "1";
         OnDevices(host, {"ravik", "tolva,id=0x12010000", "tolva,id=0x12010101"}, Reset<0>);
     }},
    {"settings-reset-without-flash",
     "velk",
     {{"FlashResetSetting", "0"}, {"FlashProgramCRCOption", "1"}},
     [](RecordingHost& host, Plugin& plugin) {
         Reset<1>(host, plugin);
         Reset<2>(host, plugin);
         Load(host, plugin, 0, 0);
     }},
    {"user-registers",
     "quen,keyconfig=0xFFFFFFEF",
     {},
     [](RecordingHost& host, Plugin& plugin) {
         for (const char* name : {"ReadUserRegister0", "ProgramUserRegister0",
                                  "ProgramUserRegister1", "ReadUserRegister1"}) {
             Perform(host, plugin, name);
         }
         host.settings.erase("FlashUserRegister1Commit");
         Perform(host, plugin, "ProgramUserRegister1");
     }},
    {"mac-address",
     "tolva",
     {},
     [](RecordingHost& host, Plugin& plugin) {
         Perform(host, plugin, "ProgramMACAddress");
         Perform(host, plugin, "ReadMACAddress");  // leaves a text without leading zeros
         Perform(host, plugin, "ProgramMACAddress");
         host.settings["FlashMACAddrInput"] = "1 xx-1.G2 Ff:+7/b";
         host.settings["FlashMACAddrCommit"] = "true";
         Perform(host, plugin, "ProgramMACAddress");
     }},
    {"commit-never-ends",
     "mesk,commit=never",
     {},
     [](RecordingHost& host, Plugin& plugin) {
         Perform(host, plugin, "ProgramUserRegister1");
         std::erase(host.transcript, "read 1x4 0x400FD008 page 1 = 0x00000008");
     }},
    {"no-user-registers",
     "ravik",
     {},
     [](RecordingHost& host, Plugin&) {
         OnDevices(host, {"ravik", "tolva,id=0x00010200"},
                   [](RecordingHost& other, Plugin& plugin) {
                       Perform(other, plugin, "ReadMACAddress");
                   });
     }},
    {"other-operations",
     "tolva",
     {},
     [](RecordingHost& host, Plugin& plugin) {
         Perform(host, plugin, "Test");
         Perform(host, plugin, "erase");
         Perform(host, plugin, nullptr);
         host.fault = {host.calls + 1, 1, ""};
         Perform(host, plugin, "Test");
         host.fault = {host.calls + 1, 2, "injected failure"};
         Perform(host, plugin, "Erase ");
     }},
};

class TranscriptTest : public testing::TestWithParam<Scenario> {};

TEST_P(TranscriptTest, IsAsRecorded) {
    const Scenario& scenario = GetParam();
    RecordingHost host(scenario.device, scenario.settings);
    host.transcribe = std::string(scenario.name) == "initialize";
    {
        Plugin plugin(host);
        host.transcribe = true;
        scenario.run(host, plugin);
        host.transcript.emplace_back("Destroy");
    }
    std::ostringstream actual;
    for (const std::string& line : host.transcript)
        actual << line << '\n';

    const std::string path = std::string(TRANSCRIPT_DIRECTORY) + "/" + scenario.name + ".txt";
    if (std::getenv("CORVANE_WRITE_TRANSCRIPTS") != nullptr) {
        std::ofstream(path) << actual.str();
        FAIL() << path << ": written, read it";
    }
    std::ostringstream expected;
    expected << std::ifstream(path).rdbuf();
    EXPECT_EQ(actual.str(), expected.str());
    EXPECT_EQ(host.openDisplays, 0);
    EXPECT_FALSE(host.displayMisused);
}

INSTANTIATE_TEST_SUITE_P(, TranscriptTest, testing::ValuesIn(Scenarios), [](const auto& scenario) {
    std::string name = scenario.param.name;
    std::ranges::replace(name, '-', '_');
    return name;
});

}  // namespace
