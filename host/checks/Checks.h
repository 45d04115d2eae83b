// Checks: what a load needs of target, server and loader, tried one by one, and nothing erased.
//
// Two checks come first, without which there is nothing to ask: that a target can be had, and that
// it is a device of the family. The others are rows of tables. A check that fails doesn't end the
// others, unless the device doesn't answer any more. Whatever comes of them, what they wrote into
// RAM is put back and the target is left halted at its reset.

#pragma once

#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "host/driver/FlashDevice.h"

namespace host {

enum class Verdict {
    Passed,
    Noted,   ///< not as it should be; a load can do without it
    Failed,  ///< a load can't work
    NotMade,
};

struct Finding {
    const char* name;
    Verdict verdict = Verdict::Passed;
    std::string text = {};   ///< what was seen, or what came instead
    std::string means = {};  ///< what that means for a load, unless it has passed
    std::string helps = {};  ///< what to try then
};

/// The smallest, the middle and the largest of some measurements.
struct Spread {
    double minimum = 0;
    double median = 0;
    double maximum = 0;
};

/// How fast the link is; nothing of what wasn't measured.
struct LinkSpeed {
    std::optional<Spread> delaySeconds;         ///< of an access to one word
    std::optional<Spread> readBytesPerSecond;   ///< of a chunk
    std::optional<Spread> writeBytesPerSecond;  ///< the same
    std::optional<bool> live;                   ///< the running target can be looked at
};

struct CheckReport {
    std::vector<Finding> findings;
    LinkSpeed speed;
};

/// Makes all checks, and shows each finding when it is there. Failure (WrongUsage, Interrupted).
CheckReport CheckTarget(const DeviceOptions& options, SettingStore& settings, Reporter& reporter,
                        const std::function<void(const Finding&)>& show);

}  // namespace host
