// What the user sees: messages and progress displays. That they are shown, and rightly, only the
// user can tell; that they are taken is checked here. Errors have operations of their own, since a
// good host calls whatever shows one a failure.

#include <utility>

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

/// A display that is ended once when it was begun, whatever comes between.
class Display {
  public:
    Display(CheckedHost& host, const char* title) : host_(host) {
        host_.Do([&](IFlashHost& h) { return h.BeginProgress(title); });
        open_ = true;
    }
    Display(const Display&) = delete;
    Display& operator=(const Display&) = delete;
    ~Display() {
        try {
            End();
        } catch (const std::exception&) {
            // The check was over before, and has its failure.
        }
    }

    void Update(std::uint32_t percent, const char* text) {
        host_.Do([&](IFlashHost& h) { return h.UpdateProgress(percent, text); });
    }

    void End() {
        if (std::exchange(open_, false)) host_.Do([](IFlashHost& h) { return h.EndProgress(); });
    }

  private:
    CheckedHost& host_;
    bool open_ = false;
};

/// For checks that aren't about the beginning.
struct OpenDisplay : Display {
    explicit OpenDisplay(CheckedHost& host) try : Display(host, "Checking the host") {
    } catch (const Breach&) {
        throw NotChecked("no display can be begun");
    }
};

std::string BeginsADisplay(CheckedHost& host) {
    const Display display(host, "Checking the host");
    return "";
}

std::string TakesEveryPercentage(CheckedHost& host) {
    OpenDisplay display(host);
    for (std::uint32_t percent = 0; percent <= 100; ++percent)
        display.Update(percent, "checking");
    return "";
}

// The plug-in's percentages wrap over ranges of more than 40 MiB.
std::string TakesFewerPercent(CheckedHost& host) {
    OpenDisplay display(host);
    display.Update(50, "checking");
    display.Update(0, kAwkward);
    display.Update(0, "");
    return "";
}

std::string EndsADisplay(CheckedHost& host) {
    OpenDisplay display(host);
    display.End();
    return "";
}

std::string DisplaysAgain(CheckedHost& host) {
    OpenDisplay(host).End();
    Display second(host, kAwkward);
    second.Update(50, "half");
    second.End();
    Display(host, "A display without updates").End();
    return "";
}

constexpr Check kDisplayChecks[] = {
    {Stage::Initialize, "ShowMessage", "null for a text with percent signs and UTF-8",
     TakesAwkwardMessages},
    {Stage::Initialize, "ShowMessage", "null for a text of 300 characters", TakesLongMessages},
    {Stage::Display, "BeginProgress", "null", BeginsADisplay},
    {Stage::Display, "UpdateProgress", "null for 0 to 100 percent", TakesEveryPercentage},
    {Stage::Display, "UpdateProgress", "null for fewer percent than before", TakesFewerPercent},
    {Stage::Display, "EndProgress", "null", EndsADisplay},
    {Stage::Display, "BeginProgress", "further displays after the first", DisplaysAgain},
};

}  // namespace

std::span<const Check> DisplayChecks() {
    return kDisplayChecks;
}

}  // namespace hostcheck
