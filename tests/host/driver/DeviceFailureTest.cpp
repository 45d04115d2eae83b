// What is said of a failure, from what is known by then.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "host/driver/DeviceFailure.h"
#include "tests/support/Cases.h"

namespace host {
namespace {

/// Flash that was attempted, erased, programmed and handed over from 0 on: "A of B, ...".
void Touch(KnownState& state, const std::string& line) {
    unsigned erased = 0, sectors = 0, programmed = 0, image = 0, handedOver = 0;
    std::sscanf(line.c_str(), "erased %u of %u, programmed %u of %u, handed over %u", &erased,
                &sectors, &programmed, &image, &handedOver);
    const auto add = [](base::AddressSet& set, unsigned bytes) {
        if (bytes != 0) set.Add({0, bytes - 1});
    };
    add(state.flash.attempted, std::max(sectors, image));
    add(state.flash.erased, erased);
    add(state.flash.programmed, programmed);
    add(state.flash.handedOver, handedOver);
    state.phases[Phase::Erase] = {erased, sectors};
    state.phases[Phase::Program] = {programmed, image};
}

/// What a line of failures.txt says is known.
void Know(KnownState& state, const std::string& line) {
    const std::string word = line.substr(0, line.find(' '));
    const std::string rest = line.substr(std::min(word.size() + 1, line.size()));
    std::istringstream values(rest);
    values.unsetf(std::ios::basefield);
    std::uint32_t first = 0;
    std::uint32_t second = 0;
    std::string commit;
    values >> first >> second >> commit;
    if (word == "traced") state.traced = true;
    if (word == "unidentified") state.identified = false;
    if (word == "interrupted") state.interrupted = true;
    if (word == "halt-failed") state.haltFailed = true;
    if (word == "advice") state.advice = rest;
    if (word == "doubt") state.doubt = rest;
    if (word == "not-blank") state.notBlank = {first, static_cast<std::uint8_t>(second)};
    if (word == "holds") state.registerValues.at(first) = second;
    if (word == "registers" || word == "wrote") state.registers.accessed = true;
    if (word == "wrote")
        state.registers.registers.at(first) = {second, commit == "None"    ? Commit::None
                                                       : commit == "Begun" ? Commit::Begun
                                                                           : Commit::Done};
    if (word == "erased") Touch(state, line);
}

TEST(DeviceFailure, TellsWhatWasDoneWhyItFailedAndWhatTheDeviceHolds) {
    for (const test::Scenario& row : test::ReadScenarios("host/driver/failures.txt")) {
        std::vector<std::string> call = test::Split(row.device, " | ");
        call.resize(4);
        const bool shown = !call[2].empty() && call[2] != "-";
        KnownState state;
        std::map<std::string, std::string> said;
        for (const std::string& line : row.steps) {
            Know(state, line);
            said[line.substr(0, line.find(' '))] = line.substr(line.find(' ') + 1);
        }
        const DeviceFailure failure = MakeDeviceFailure(
            {call[0], call[1], shown ? std::optional(call[2]) : std::nullopt, call[3]}, state,
            Json::object());
        const std::string text = failure.what();
        EXPECT_EQ(std::to_string(static_cast<int>(failure.Status())) + ": " + text, said["says"]);
        EXPECT_EQ(failure.Remark(), said.contains("remark") ? said["remark"] : text);
        EXPECT_EQ(failure.Result()["flashChanged"], !state.flash.attempted.Empty()) << text;
        EXPECT_EQ(failure.Result().contains("registers"), state.registers.accessed) << text;
    }
}

TEST(DeviceFailure, HasTheSameInItsJson) {
    KnownState state;
    Touch(state, "erased 64 of 64, programmed 0 of 32");
    state.phases[Phase::Erase].seconds = 0.25;
    state.phases[Phase::Erase].simulatedSeconds = 1.5;
    state.notBlank = {0x20, 0x7F};
    state.registers = {true, {{{0x12, Commit::Begun}, {0x34, Commit::Done}}}};
    state.registerValues = {0x12, {}};
    const DeviceFailure failure = MakeDeviceFailure({"D", "E"}, state, {{"sectors", 3}});
    EXPECT_EQ(failure.Result().dump(),
              R"({"sectors":3,"flashChanged":true,"phases":{"erase":{"bytes":64,"seconds":0.25,)"
              R"("simulatedSeconds":1.5}},"registers":[{"register":0,"value":18,"committed":null},)"
              R"({"register":1,"value":null,"committed":true}],"blank":false,"address":32,)"
              R"("actual":127})");
}

}  // namespace
}  // namespace host
