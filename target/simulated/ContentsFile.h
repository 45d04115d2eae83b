// ContentsFile: keeps a simulated device's memory that outlives its power (flash and committed user
// registers) in a file, so that runs of a tool follow each other as on a board.

#pragma once

#include <memory>
#include <stdexcept>
#include <string>

#include "target/simulated/Clock.h"
#include "target/simulated/DeviceOptions.h"
#include "target/simulated/SimulatedDevice.h"

namespace target {

/// A contents file that can't be used. The text names the path and says what to do.
class ContentsError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// The device kept in the file at `path`, or, when there is no such file, a new one as `today`
/// says. Options that were given in `today` must agree with the kept device (OptionError); its
/// timings and faults hold in either case. The file is only read; throws ContentsError when it is
/// unreadable, torn, of another version, or no contents file at all.
std::unique_ptr<SimulatedDevice> OpenContents(const std::string& path, const DeviceOptions& today,
                                              Clock* clock = nullptr);

/// Writes the file whole under another name beside `path`, then renames it: after a crash there is
/// the old file or the new one. Throws ContentsError.
void SaveContents(const std::string& path, const SimulatedDevice& device);

}  // namespace target
