// What is said of a failure, from what is known by then.

#include <gtest/gtest.h>

#include <string>

#include "host/driver/DeviceFailure.h"

namespace host {
namespace {

struct Amount {
    std::uint64_t done;
    std::uint64_t total;
};

/// A state whose flash was attempted, erased, handed over and programmed from 0 on.
KnownState Touched(Amount erase, Amount program, std::uint32_t handedOver = 0) {
    KnownState state;
    const auto add = [](base::AddressSet& set, std::uint64_t bytes) {
        if (bytes != 0) set.Add({0, static_cast<std::uint32_t>(bytes - 1)});
    };
    add(state.flash.attempted, std::max(erase.total, program.total));
    add(state.flash.erased, erase.done);
    add(state.flash.programmed, program.done);
    add(state.flash.handedOver, handedOver);
    state.phases[Phase::Erase] = {erase.done, erase.total};
    state.phases[Phase::Program] = {program.done, program.total};
    return state;
}

KnownState With(KnownState state, void (*change)(KnownState&)) {
    change(state);
    return state;
}

KnownState With(void (*change)(KnownState&)) {
    return With({}, change);
}

constexpr char kTry[] = "; run it with --trace FILE to see every access";
constexpr char kAgain[] = "; run the command again before the device is used";

TEST(DeviceFailure, TellsWhatWasDoneWhyItFailedAndWhatTheDeviceHolds) {
    const std::string incomplete = "the flash is incomplete: ";
    const std::string asItWas = std::string("; the flash is as it was") + kTry;
    const struct {
        FailedCall call;
        KnownState state;
        ExitStatus status;
        std::string text;
        std::string remark = {};  ///< the text, when empty
    } cases[] = {
        {{"erasing", "no answer."}, {}, ExitStatus::DeviceFailed, "erasing: no answer" + asItWas},
        {{"erasing", "", "Erase failed.."},
         {},
         ExitStatus::DeviceFailed,
         "erasing: Erase failed" + asItWas,
         "erasing ended with the errors above" + asItWas},
        {{"erasing", "E", "Erase failed.."},
         {},
         ExitStatus::DeviceFailed,
         "erasing: Erase failed; then E" + asItWas,
         "erasing ended with the errors above; then E" + asItWas},
        {{"erasing", "E", "S.", "the cable"},
         With([](KnownState& state) { state.traced = true; }),
         ExitStatus::DeviceFailed,
         "erasing: S; then E; it began with: the cable; the flash is as it was; the trace has "
         "every "
         "access",
         "erasing failed: the cable; the flash is as it was; the trace has every access"},
        {{"erasing", "lost: the cable", {}, "the cable"},
         {},
         ExitStatus::DeviceFailed,
         "erasing: lost: the cable" + asItWas},
        {{"identifying", "no answer"},
         With([](KnownState& state) {
             state.identified = false;
             state.advice = "look";
         }),
         ExitStatus::Unreachable,
         "can't reach the target: identifying: no answer; look"},
        {{"erasing", "E"},
         With([](KnownState& state) { state.interrupted = state.haltFailed = true; }),
         ExitStatus::Interrupted,
         "interrupted; the flash is as it was; the target couldn't be halted"},
        {{"D", "E"},
         Touched({1024, 2048}, {0, 0}),
         ExitStatus::DeviceFailed,
         "D: E; " + incomplete + "1 KiB erased" + kAgain + kTry},
        {{"D", "E"},
         Touched({4096, 4096}, {2048, 3000}, 3000),
         ExitStatus::DeviceFailed,
         "D: E; " + incomplete +
             "4 KiB erased, 2 KiB of 2.9 KiB written, 952 bytes handed to the loader and not seen "
             "to be finished" +
             kAgain + kTry},
        {{"D", "E"},
         Touched({4096, 4096}, {3000, 3000}, 3000),
         ExitStatus::DeviceFailed,
         std::string("D: E; the image is programmed, but not compared") + kTry},
        {{"D", "E"},
         Touched({4096, 4096}, {0, 0}),
         ExitStatus::DeviceFailed,
         std::string("D: E; 4 KiB are erased, but not compared") + kTry},
        // An erase that wasn't seen to end isn't made good by what was programmed over it.
        {{"D", "E"},
         Touched({0, 4096}, {4096, 4096}),
         ExitStatus::DeviceFailed,
         "D: E; " + incomplete + "0 bytes erased, 4 KiB of 4 KiB written" + kAgain + kTry},
        {{"checking", "", "not blank"},
         With([](KnownState& state) {
             state.notBlank = {0x20, 0x7F};
         }),
         ExitStatus::ContentsDiffer,
         "checking: not blank",
         "the flash isn't blank: 0x20 holds 0x7f, not 0xff"},
        {{"checking", "", "not blank"},
         With(Touched({64, 64}, {0, 32}),
              [](KnownState& state) {
                  state.notBlank = {0x20, 0};
              }),
         ExitStatus::ContentsDiffer,
         "checking: not blank; it was erased just now, so the cell is worn out or protected; " +
             incomplete + "64 bytes erased, 0 bytes of 32 bytes written" + kAgain,
         "the flash isn't blank: 0x20 holds 0x00, not 0xff; it was erased just now, so the cell is "
         "worn out or protected; " +
             incomplete + "64 bytes erased, 0 bytes of 32 bytes written" + kAgain},
        // What a failed access has left in the buffer is no contents.
        {{"checking", "E", {}, "lost"},
         With([](KnownState& state) {
             state.notBlank = {0x20, 0x7F};
         }),
         ExitStatus::DeviceFailed,
         "checking: E; it began with: lost" + asItWas},
        // What was read of a device that is gone is no contents, and shows nothing done.
        {{"checking", "", "not blank"},
         With([](KnownState& state) {
             state.notBlank = {0x20, 0};
             state.doubt = "gone";
         }),
         ExitStatus::Unreachable,
         "checking: gone; what was read of it can't be believed; the flash is as it was"},
        {{"D", "E", {}, "the cable"},
         With(Touched({64, 64}, {64, 64}),
              [](KnownState& state) {
                  state.registers = {true, {{{0x12, Commit::Done}, {}}}};
                  state.registerValues = {0x12, 0x34};
                  state.doubt = "gone";
              }),
         ExitStatus::DeviceFailed,
         "D: gone; it began with: the cable; what was read of it can't be believed; user register "
         "0 may have changed and can't be read (perhaps committed), user register 1 is as it was; "
         "what the flash holds isn't known" +
             std::string(kAgain)},
        {{"D", "E"},
         With([](KnownState& state) { state.registers.accessed = true; }),
         ExitStatus::DeviceFailed,
         std::string("D: E; the user registers are as they were") + kTry},
        {{"D", "E"},
         With(Touched({64, 128}, {0, 0}),
              [](KnownState& state) {
                  state.registers = {true, {{{0x12, Commit::Begun}, {0x34, Commit::Done}}}};
                  state.registerValues = {0x12, {}};
              }),
         ExitStatus::DeviceFailed,
         "D: E; user register 0 holds 0x00000012 (perhaps committed), user register 1 may have "
         "changed and can't be read (committed); " +
             incomplete + "64 bytes erased" + kAgain + kTry},
        {{"D", "E"},
         With([](KnownState& state) {
             state.registers = {true, {{{0x12, Commit::None}, {}}}};
             state.registerValues = {0x56, {}};
         }),
         ExitStatus::DeviceFailed,
         std::string(
             "D: E; user register 0 holds 0x00000056 (not committed), user register 1 is as "
             "it was") +
             kTry},
    };
    for (const auto& [call, state, status, text, remark] : cases) {
        const DeviceFailure failure = MakeDeviceFailure(call, state, Json::object());
        EXPECT_EQ(failure.what(), text);
        EXPECT_EQ(failure.Remark(), remark.empty() ? text : remark);
        EXPECT_EQ(failure.Status(), status) << text;
        EXPECT_EQ(failure.Result()["flashChanged"], !state.flash.attempted.Empty()) << text;
        EXPECT_EQ(failure.Result().contains("registers"), state.registers.accessed) << text;
    }
}

TEST(DeviceFailure, HasTheSameInItsJson) {
    KnownState state = Touched({64, 64}, {0, 32});
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
