// A lean host that remembers its calls and makes them once more without a plug-in: what is left of
// a run's time beyond that is the plug-in's own work.

#pragma once

#include <set>
#include <string>
#include <vector>

#include "bench/support/LeanHost.h"

namespace bench {

class ReplayHost final : public test::LeanHost {
  public:
    using LeanHost::LeanHost;

    bool recording = false;

    /// Makes the recorded calls once more.
    void Replay();

  private:
    const char* Note(const test::Call& call) override;
    void Make(const test::Call& call);

    std::vector<test::Call> calls_;
    std::set<std::string> texts_;  ///< of the recorded calls
    std::vector<std::uint8_t> buffer_ = std::vector<std::uint8_t>(1 << 17);
};

}  // namespace bench
