// OptionTable: one row for each device option. Parser, help, completion and the comparison with a
// kept device all go by it; adding an option is adding a row.

#pragma once

#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "target/simulated/options/DeviceOptions.h"

namespace target {

struct OptionRow {
    const char* name;
    const char* accepts;
    const char* meaning;
    /// False when the text is none of what is accepted.
    bool (*set)(DeviceOptions& options, std::string_view text);
    /// The value as text, for an option that tells the device from others; null for what may
    /// differ from run to run.
    std::string (*definition)(const DeviceOptions& options);
    /// All that is accepted, where that is a few words.
    std::vector<const char*> words = {};
};

std::span<const OptionRow> OptionTable();

/// A register's value with all its digits.
std::string RegisterText(std::uint32_t value);

}  // namespace target
