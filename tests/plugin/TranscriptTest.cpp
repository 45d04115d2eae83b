// Whole transcripts, host calls and trace lines interleaved, of what the order matters in. They
// are compared with the files in tests/plugin/transcripts; run with CORVANE_WRITE_TRANSCRIPTS=1 to
// write these anew, and read every changed line before you keep it: boards depend on them.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdlib>
#include <fstream>
#include <map>
#include <numeric>
#include <sstream>

#include "tests/support/Cases.h"
#include "tests/support/RecordingHost.h"

namespace {

using test::Plugin;
using test::RecordingHost;
using test::Scenario;

/// A device object and its host, and the steps that one can take with them.
class Stage {
  public:
    Stage(RecordingHost& host, Plugin& plugin) : host_(host), plugin_(plugin) {}

    void Take(const std::string& step) {
        const auto blank = step.find(' ');
        const std::string word = step.substr(0, blank);
        const std::string rest = step.substr(blank + 1);
        if (rest == "gone") {
            host_.settings.erase(word);
        } else if (rest[0] == '=') {
            host_.settings[word] = rest.substr(std::min<std::size_t>(rest.size(), 2));
        } else {
            std::istringstream words(rest);
            (this->*kSteps.at(word))(words);
        }
    }

  private:
    using Words = std::istringstream;

    static std::string Rest(Words& words) {
        std::string rest;
        std::getline(words >> std::ws, rest);
        return rest;
    }
    template <typename Number = std::uint32_t>
    static Number Hex(Words& words) {
        Number number = 0;
        words >> std::hex >> number >> std::dec;
        return number;
    }

    // Notes what a call returned, so that the transcript shows it.
    void Returned(const char* call, const char* error) {
        host_.transcript.push_back(call +
                                   (error == nullptr ? " done" : " failed: " + std::string(error)));
    }
    void Perform(const std::string& name) {
        Returned("PerformOperation",
                 plugin_->PerformOperation(name == "(null)"          ? nullptr
                                           : name == "Erase (blank)" ? "Erase "
                                                                     : name.c_str()));
    }

    void Initialize(Words& /*words*/) {
        bool flash = false;
        const char* operations = nullptr;
        Returned("Initialize", plugin_->Initialize(&flash, &operations));
        host_.transcript.push_back((flash ? "flash, " : "no flash, ") + std::string(operations));
    }
    // An answer is stored with success alone.
    void Answered(const char* call, const char* error, bool answer) {
        Returned(call, error);
        host_.transcript.back() += error == nullptr ? (answer ? ": yes" : ": no")
                                   : answer         ? ""
                                                    : ", and stored an answer";
    }
    void Within(Words& words) {
        bool within = true;
        const auto address = Hex<std::uint64_t>(words);
        std::int32_t size = 0;
        const char* const error = words >> size
                                      ? plugin_->AddressWithinFlash(address, size, &within)
                                      : plugin_->AddressWithinFlash(address, &within);
        Answered("AddressWithinFlash", error, within);
    }
    void Special(Words& words) {
        bool special = true;
        const char* const error =
            plugin_->AddressWithinSpecialRegion(Hex<std::uint64_t>(words), &special);
        Answered("special region", error, special);
    }
    void LoadHalfwords(Words& /*words*/) {
        const std::uint16_t* const none = nullptr;
        Returned("WriteDataToFlash", plugin_->WriteDataToFlash(none, 0, 0, 0));
    }
    void Create(Words& words) {
        RecordingHost other(Rest(words));
        other.transcribe = true;
        const Plugin created(other);
        std::ranges::move(other.transcript, std::back_inserter(host_.transcript));
    }
    void Load(Words& words) {
        static std::vector<std::uint8_t> bytes(8192);
        std::iota(bytes.begin(), bytes.end(), std::uint8_t{1});
        host_.data = bytes.data();
        const auto address = Hex<std::uint64_t>(words);
        std::uint32_t length = 0;
        words >> length;
        Returned("WriteDataToFlash", plugin_->WriteDataToFlash(bytes.data(), address, length, 1));
    }
    void Reset(Words& words) {
        int mode = 0;
        words >> mode;
        Returned("ResetSettings", plugin_->ResetSettings(mode));
    }
    void PerformStep(Words& words) { Perform(Rest(words)); }
    void Range(Words& words) {
        std::string start;
        std::string end;
        words >> start >> end;
        for (const std::string prefix : {"FlashBlankCheck", "FlashChecksum"}) {
            host_.settings[prefix + "Selection"] = "By Address Range";
            host_.settings[prefix + "StartAddr"] = start;
            host_.settings[prefix + "EndAddr"] = end;
        }
        Perform(Rest(words));
    }
    void Write(Words& words) {
        const std::uint32_t address = Hex(words);
        const std::uint32_t word = Hex(words);
        host_.Device().Write(&word, 1, address, 1, 4);
    }
    void Preset(Words& words) {
        std::uint32_t address = Hex(words);
        for (std::uint32_t byte = Hex(words); words; byte = Hex(words))
            host_.Device().Flash().Preset(
                address++, std::array<std::uint8_t, 1>{static_cast<std::uint8_t>(byte)});
    }
    // The call that is so many from here, and how many with it; or the next one that begins so.
    void Fail(Words& words) {
        std::uint64_t first = 0;
        std::uint64_t count = 0;
        words >> first >> count;
        host_.fault = {host_.calls + first, count, words.eof() ? "injected failure" : ""};
    }
    void FailNext(Words& words) { host_.failNext = Rest(words); }

    // Replaces thousands of equal lines by how many they were, or by nothing.
    void Count(Words& words) {
        const std::string line = Rest(words);
        const auto count = std::erase(host_.transcript, line);
        host_.transcript.push_back(std::to_string(count) + " times: " + line);
    }
    void Drop(Words& words) { std::erase(host_.transcript, Rest(words)); }

    // Steps on another device, with the settings of this one; the time that passed is noted.
    void On(Words& words) {
        std::string device;
        std::getline(words, device, ':');
        RecordingHost host(device, host_.settings);
        Plugin plugin(host);
        host.transcribe = true;
        const auto start = test::VirtualNow();
        for (const std::string& step : test::Split(Rest(words), "; "))
            Stage(host, plugin).Take(step);
        host_.transcript.push_back(device);
        std::ranges::move(host.transcript, std::back_inserter(host_.transcript));
        const auto passed =
            std::chrono::round<std::chrono::milliseconds>(test::VirtualNow() - start);
        host_.transcript.push_back(std::to_string(passed.count()) + " ms");
    }

    static const std::map<std::string, void (Stage::*)(Words&)> kSteps;

    RecordingHost& host_;
    Plugin& plugin_;
};

const std::map<std::string, void (Stage::*)(Stage::Words&)> Stage::kSteps = {
    {"initialize", &Stage::Initialize},
    {"within", &Stage::Within},
    {"special", &Stage::Special},
    {"create", &Stage::Create},
    {"load", &Stage::Load},
    {"load-halfwords", &Stage::LoadHalfwords},
    {"reset", &Stage::Reset},
    {"perform", &Stage::PerformStep},
    {"range", &Stage::Range},
    {"write", &Stage::Write},
    {"preset", &Stage::Preset},
    {"fail", &Stage::Fail},
    {"fail-next", &Stage::FailNext},
    {"count", &Stage::Count},
    {"drop", &Stage::Drop},
    {"on", &Stage::On},
};

class TranscriptTest : public testing::TestWithParam<Scenario> {};

TEST_P(TranscriptTest, IsAsRecorded) {
    const Scenario& scenario = GetParam();
    RecordingHost host(scenario.device);
    host.transcribe = scenario.name == "initialize";
    {
        Plugin plugin(host);
        host.transcribe = true;
        for (const std::string& step : scenario.steps)
            Stage(host, plugin).Take(step);
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

INSTANTIATE_TEST_SUITE_P(, TranscriptTest,
                         testing::ValuesIn(test::ReadScenarios("plugin/scenarios.txt")),
                         [](const auto& scenario) {
                             std::string name = scenario.param.name;
                             std::ranges::replace(name, '-', '_');
                             return name;
                         });

}  // namespace
