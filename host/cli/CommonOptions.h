// The values of the options that every command takes. Texts stay texts: whoever uses one reads it,
// and says what is wrong with it.

#pragma once

#include <optional>
#include <string>
#include <vector>

#include "host/targets/OpenTarget.h"

namespace host {

struct SettingOptions {
    std::optional<std::string> settingsFile;
    std::vector<std::string> set;  ///< as KEY=TEXT
};

struct OutputOptions {
    std::string progress = "auto";
    bool json = false;
    bool quiet = false;
    int verbose = 0;
};

struct PlacedOption {
    std::string option;  ///< "--gdb"
    std::string text;
    std::string place;
};

struct CommonOptions : TargetOptions, SettingOptions, OutputOptions {
    std::optional<std::string> plugin;
    std::optional<std::string> trace;
    bool force = false;  ///< existing files may be written over

    std::optional<std::string> board;

    /// Those variables of the environment that have named a target.
    std::vector<std::string> targetVariables;

    /// What wasn't typed, and where it comes from: "environment", or the project file.
    std::vector<PlacedOption> placed;
};

}  // namespace host
