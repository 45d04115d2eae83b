// How long Sleep sleeps. The plug-in's pauses are from 5 to 50 ms; the hardware needs them whole,
// and thousands of them must not take all day.

#include <algorithm>
#include <chrono>

#include "hostcheck/Checks.h"

namespace hostcheck {

namespace {

/// A host whose Sleep lets simulated time pass knows this setting, as "1".
constexpr char kSimulatesTime[] = "HostSimulatesTime";

constexpr std::uint32_t kPausesMs[] = {5, 15, 20, 50};
constexpr std::uint32_t kJudgedPauseMs = 20;
constexpr double kLongestMs = 100;

void RequireRealTime(CheckedHost& host) {
    if (host.Get(kSimulatesTime) == "1")
        throw NotChecked(std::string("the setting ") + kSimulatesTime + " is 1");
}

double SleptMs(CheckedHost& host, std::uint32_t milliseconds) {
    const auto start = std::chrono::steady_clock::now();
    host.Sleep(milliseconds);
    return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start)
        .count();
}

std::string Slept(double ms, std::uint32_t asked) {
    const auto hundredths = static_cast<std::uint64_t>(ms * 100);
    std::string text = std::to_string(hundredths / 100) + ".";
    for (const std::uint64_t digit : {hundredths / 10 % 10, hundredths % 10})
        text += static_cast<char>('0' + digit);
    return text + " ms for " + std::to_string(asked);
}

std::string SleepsLongEnough(CheckedHost& host) {
    RequireRealTime(host);
    for (const std::uint32_t asked : kPausesMs)
        if (const double slept = SleptMs(host, asked); slept < asked)
            throw Breach(Slept(slept, asked));
    return "";
}

// Somebody else may have the processor for a while, but hardly three times.
std::string SleepsNotMuchLonger(CheckedHost& host) {
    RequireRealTime(host);
    double shortest = SleptMs(host, kJudgedPauseMs);
    for (int i = 0; i < 2 && shortest > kLongestMs; ++i)
        shortest = std::min(shortest, SleptMs(host, kJudgedPauseMs));
    if (shortest > kLongestMs) throw Breach(Slept(shortest, kJudgedPauseMs));
    return Slept(shortest, kJudgedPauseMs);
}

constexpr Check kPauseChecks[] = {
    {Stage::Initialize, "Sleep", "pauses that last as long as was asked", SleepsLongEnough},
    {Stage::Initialize, "Sleep", "pauses that don't last many times as long", SleepsNotMuchLonger},
};

}  // namespace

std::span<const Check> PauseChecks() {
    return kPauseChecks;
}

}  // namespace hostcheck
