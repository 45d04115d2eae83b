#include "hostcheck/Report.h"

#include <utility>

namespace hostcheck {

void Report::Open() {
    open_ = true;
    for (const Line& line : std::exchange(waiting_, {}))
        Show(line);
}

void Report::Note(Verdict verdict, const std::string& text) {
    ++counts_[static_cast<std::size_t>(verdict)];
    Put({verdict == Verdict::Fails, text});
}

void Report::Say(const std::string& text) {
    Put({false, text});
}

void Report::SayAsError(const std::string& text) {
    Put({true, text});
}

void Report::Put(Line line) {
    if (open_)
        Show(line);
    else
        waiting_.push_back(std::move(line));
}

void Report::Summarise(const std::string& call) {
    const auto [held, failed, unchecked] = std::exchange(counts_, {});
    const std::string count = std::to_string(held) + " of " + std::to_string(held + failed);
    std::string text = "Host check, " + call + ": " + count + " hold";
    if (unchecked != 0) text += ", " + std::to_string(unchecked) + " not checked";
    Put({held == 0, text});
}

void Report::RequireShown() {
    if (!unshown_.empty()) throw std::runtime_error(std::exchange(unshown_, {}));
}

// What ShowMessage won't take is shown as an error; what ShowError won't take is returned.
void Report::Show(const Line& line) {
    std::string text = line.text;
    if (!line.failure) {
        try {
            host_.Do([&](IFlashHost& host) { return host.ShowMessage(text.c_str()); });
            return;
        } catch (const Breach& breach) {
            text = "ShowMessage: expected null for " + Quoted(text) + "; came " + breach.what();
        }
    }
    try {
        host_.Do([&](IFlashHost& host) { return host.ShowError(text.c_str()); });
    } catch (const Breach& breach) {
        if (unshown_.empty())
            unshown_ = "ShowError: expected null for " + Quoted(text) + "; came " + breach.what();
    }
}

}  // namespace hostcheck
