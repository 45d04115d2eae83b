// The target that the command line asks for: a simulated device, new or kept in a file.

#pragma once

#include <memory>
#include <string>

#include "host/Options.h"
#include "target/simulated/SimulatedDevice.h"

namespace host {

class SimulatedTarget {
  public:
    /// Failure (WrongUsage) for options that name no device, or another one than the file holds;
    /// Failure (Unreachable) for a contents file that can't be used.
    explicit SimulatedTarget(const Options& options);

    target::Target& Get() { return *device_; }

    /// Keeps the contents, if a file was named for them; a file that is there already is left alone
    /// when nothing has `changed`. Failure (Unreachable).
    void Save(bool changed) const;

  private:
    std::string path_;
    std::unique_ptr<target::SimulatedDevice> device_;
};

}  // namespace host
