// Contents: a simulated device's memory that outlives its power (flash and committed user
// registers) as the bytes of a file, so that runs of a tool can follow each other as on a board.

#pragma once

#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>

#include "target/simulated/Clock.h"
#include "target/simulated/SimulatedDevice.h"
#include "target/simulated/options/DeviceOptions.h"

namespace target {

/// Contents that can't be used: why, as the end of a sentence that names their file.
class ContentsError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// A full 128 MiB flash with its page numbers, and room for the rest.
inline constexpr std::uint64_t kContentsBytesMax = std::uint64_t{160} << 20;

/// The device that `contents` hold. Options that were given in `today` must agree with it
/// (OptionError); its timings and faults hold in either case. Throws ContentsError when they are
/// torn, of another version, or no contents at all.
std::unique_ptr<SimulatedDevice> DecodeContents(const std::string& contents,
                                                const DeviceOptions& today, Clock* clock = nullptr);

std::string EncodeContents(const SimulatedDevice& device);

}  // namespace target
