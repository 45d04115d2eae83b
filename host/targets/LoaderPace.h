// LoaderPace: how long the loader takes for a chunk, as far as looks at it tell.
//
// A look that finds a chunk at work costs a look, and with some probes a stop; one that comes late
// costs the time that the loader has stood still. So the time is kept between two bounds. As long
// as they are further apart than it is worth, the next look halves them; otherwise it comes at the
// upper one. The lower bound sinks while all is well, faster and faster, so that a flash that gets
// faster is found out.

#pragma once

#include <chrono>
#include <optional>

namespace host {

class LoaderPace {
  public:
    using Time = std::chrono::nanoseconds;

    /// How long after its begin a chunk should be looked at. After a look that came too early, when
    /// it is known to be done, or another step later.
    Time Guess() const;

    /// A chunk was at work still when the loader had run so long for it.
    void Pending(Time ran);

    /// It was done.
    void Done(Time ran);

    /// What a look costs.
    void LookTook(Time time) { lookTime_ = time; }
    Time LookTime() const { return lookTime_; }

  private:
    /// How far apart the bounds may be: little beside what a chunk costs at all.
    Time Margin() const;

    Time least_{0};
    std::optional<Time> most_;
    Time step_ = std::chrono::milliseconds(1);  ///< beyond the lower bound, where there is no other
    Time sinking_{0};
    Time lookTime_{0};
    bool tooEarly_ = false;  ///< the last look
    bool known_ = false;
};

}  // namespace host
