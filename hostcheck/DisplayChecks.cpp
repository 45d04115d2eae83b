// What the user sees: messages and progress displays. That they are shown, and rightly, only the
// user can tell; that they are taken is checked here. Errors have operations of their own, since a
// good host calls whatever shows one a failure.

#include "hostcheck/Checks.h"

namespace hostcheck {

namespace {

/// A host that takes a text for a printf format, or that isn't ready for UTF-8, garbles this.
constexpr char kAwkward[] = "100 % of %s, %d and %n; \xC2\xB5s, \xC3\xA4, \xE2\x9C\x93";

std::string TakesAwkwardMessages(CheckedHost& host) {
    const std::string text =
        std::string("This text comes as it is, percent signs and all: ") + kAwkward;
    host.Do([&](IFlashHost& h) { return h.ShowMessage(text.c_str()); });
    return "";
}

std::string TakesLongMessages(CheckedHost& host) {
    const std::string text =
        "This text ends in a full stop behind 250 dashes: " + std::string(250, '-') + ".";
    host.Do([&](IFlashHost& h) { return h.ShowMessage(text.c_str()); });
    return "";
}

void Begin(CheckedHost& host, const char* title) {
    host.Do([&](IFlashHost& h) { return h.BeginProgress(title); });
}

void Update(CheckedHost& host, std::uint32_t percent, const char* text) {
    host.Do([&](IFlashHost& h) { return h.UpdateProgress(percent, text); });
}

void End(CheckedHost& host) {
    host.Do([](IFlashHost& h) { return h.EndProgress(); });
}

std::string BeginsADisplay(CheckedHost& host) {
    Begin(host, "Checking the host");
    return "";
}

std::string TakesEveryPercentage(CheckedHost& host) {
    for (std::uint32_t percent = 0; percent <= 100; ++percent)
        Update(host, percent, "checking");
    return "";
}

// The plug-in's percentages wrap over ranges of more than 40 MiB.
std::string TakesFewerPercent(CheckedHost& host) {
    Update(host, 0, kAwkward);
    Update(host, 0, "");
    return "";
}

std::string EndsADisplay(CheckedHost& host) {
    End(host);
    return "";
}

std::string DisplaysAgain(CheckedHost& host) {
    Begin(host, kAwkward);
    Update(host, 50, "half");
    End(host);
    Begin(host, "A display without updates");
    End(host);
    return "";
}

constexpr Check kDisplayChecks[] = {
    {Stage::Initialize, "ShowMessage", "null for a text with percent signs and UTF-8",
     TakesAwkwardMessages},
    {Stage::Initialize, "ShowMessage", "null for a text of 300 characters", TakesLongMessages},
    {Stage::Operation, "BeginProgress", "null", BeginsADisplay},
    {Stage::Operation, "UpdateProgress", "null for 0 to 100 percent", TakesEveryPercentage},
    {Stage::Operation, "UpdateProgress", "null for fewer percent than before", TakesFewerPercent},
    {Stage::Operation, "EndProgress", "null", EndsADisplay},
    {Stage::Operation, "BeginProgress", "further displays after the first", DisplaysAgain},
};

}  // namespace

std::span<const Check> DisplayChecks() {
    return kDisplayChecks;
}

}  // namespace hostcheck
