// The order in which a host makes the calls of a load: ResetSettings(0), the sections,
// ResetSettings(2).

#pragma once

#include <cstdint>
#include <string>

namespace hostcheck {

class LoadSequence {
  public:
    /// Each takes a call of the host. Returns what should have come instead, or the empty text.
    std::string Reset(std::int32_t mode);
    std::string Section();

    /// Whether no section of the load has come yet.
    bool AtFirstSection() const { return state_ != State::Sections; }

    /// Whether a whole load has gone by.
    bool Completed() const { return completed_; }

  private:
    enum class State {
        Nothing,   ///< no load has begun, or it was given up
        Begun,     ///< after ResetSettings(0) or (4)
        Sections,  ///< after a section
    };

    State state_ = State::Nothing;
    bool completed_ = false;
};

}  // namespace hostcheck
