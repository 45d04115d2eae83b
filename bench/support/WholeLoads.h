// The plug-in under a host that waits for the loader, and under one that doesn't: what a load takes
// on the simulated device beside what link and flash need for it.

#pragma once

#include <chrono>
#include <cstdint>
#include <utility>
#include <vector>

namespace test {

struct Link {
    std::uint32_t latencyUs;
    std::uint32_t bandwidthKB;  ///< thousands of bytes a second
    std::uint32_t chunkMs;      ///< flash time of a loader chunk
};

struct ToolTime {
    using Seconds = std::chrono::duration<double>;
    Seconds limit;    ///< for each chunk the slower of link and flash, and the fixed pauses
    Seconds waiting;  ///< under the host that waits, to the end of the last chunk
    Seconds polling;  ///< under the one that doesn't, to the end of the plug-in's work
    Seconds samples;  ///< looking whether the flash holds the image, when it doesn't
    std::uint64_t chunks = 0;
    std::uint64_t looks = 0;  ///< at the status words, by the host that waits

    double Ratio() const { return waiting / limit; }
    double RatioOfPolling() const { return polling / limit; }
};

/// Programming 1 MiB of erased flash over that link.
ToolTime MeasureTool(const Link& link);

inline constexpr char kNoErase[] = "Do Not Erase Flash Memory";
inline constexpr char kNecessary[] = "Necessary Pages Only";

using Sections = std::vector<std::pair<std::uint32_t, std::uint32_t>>;  ///< addresses and sizes

/// A load of those sections under the host that waits.
ToolTime::Seconds LoadTime(const Link& link, const char* device, const char* option,
                           const Sections& sections);

/// Latencies, bandwidths and chunk times of real probes and devices, all combined.
std::vector<Link> ToolLinks();

}  // namespace test
