// The JSON type of the tool: members keep the order in which they were written, so that the lines
// read alike from run to run.

#pragma once

#include <cmath>
#include <nlohmann/json.hpp>

namespace host {

using Json = nlohmann::ordered_json;

/// Seconds to the microsecond: more digits are noise.
inline Json SecondsJson(double seconds) {
    return std::round(seconds * 1e6) / 1e6;
}

}  // namespace host
