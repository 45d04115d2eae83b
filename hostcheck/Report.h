// What was found, told to the host line by line as it comes, so that a host that crashes or hangs
// has told which check it was.

#pragma once

#include <array>
#include <string>
#include <vector>

#include "hostcheck/CheckedHost.h"

namespace hostcheck {

enum class Verdict { Holds, Fails, NotChecked };

class Report {
  public:
    explicit Report(const CheckedHost& host) : host_(host) {}

    /// Nothing is shown before this, since nothing may be shown while a device is created.
    void Open();

    /// A finding, which counts.
    void Note(Verdict verdict, const std::string& text);

    /// A remark, which doesn't.
    void Say(const std::string& text);
    void SayAsError(const std::string& text);

    /// The counts since the last summary, for that call of the host; a failure when a call that
    /// checks has checked nothing.
    void Summarise(const std::string& call);

    /// Throws std::runtime_error with the first line that the host couldn't even be shown as an
    /// error, and forgets it.
    void RequireShown();

  private:
    struct Line {
        bool failure;
        std::string text;
    };

    void Put(Line line);
    void Show(const Line& line);

    const CheckedHost& host_;
    std::vector<Line> waiting_;
    bool open_ = false;
    std::array<int, 3> counts_{};  ///< by verdict
    std::string unshown_;
};

}  // namespace hostcheck
