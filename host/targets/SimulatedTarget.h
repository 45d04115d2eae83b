// The target that the command line asks for: a simulated device, new or kept in a file.

#pragma once

#include <memory>
#include <optional>
#include <string>

#include "host/base/FileLock.h"
#include "target/simulated/SimulatedDevice.h"

namespace host {

/// As the command line names it.
struct TargetOptions {
    std::optional<std::string> sim;      ///< class and options of a simulated device
    std::optional<std::string> simFile;  ///< where its contents are kept
};

class SimulatedTarget {
  public:
    /// Keeps the contents file locked for as long as it lives; what there is to wait for is told to
    /// `say`. Failure (WrongUsage) for options that name no device, or another one than the file
    /// holds; Failure (Unreachable) for a contents file that can't be used.
    SimulatedTarget(const TargetOptions& options, const WaitNotice& say);

    target::Target& Get() { return *device_; }

    /// Keeps the contents, if a file was named for them; a file that is there already is left alone
    /// when nothing has `changed`. Failure (Unreachable).
    void Save(bool changed) const;

  private:
    std::string path_;
    std::optional<FileLock> lock_;
    std::unique_ptr<target::SimulatedDevice> device_;
};

}  // namespace host
