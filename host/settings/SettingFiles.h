// The two TOML files of settings: the user's, which people edit and the tool only reads, and the
// kept one beside it, which the tool writes.

#pragma once

#include <map>
#include <string>

#include "host/files/FileKind.h"

namespace host {

inline constexpr FileKind kSettingsFile{"settings file", ExitStatus::BadFile,
                                        std::uint64_t{1} << 20};

/// Keys, spelt as in the catalogue, and their texts.
using SettingTexts = std::map<std::string, std::string>;

struct SettingPaths {
    std::string user;  ///< empty: no place is known
    std::string kept;
    bool userMustExist = false;
    std::string project = {};  ///< empty: there is none
};

/// `chosen` is the file that the command line names. Without one, the user's file lies in
/// corvane-flash/settings.toml in the user's directory for that. Beside a chosen one that is no
/// regular file (a pipe, a device) nothing is kept.
SettingPaths FindSettingPaths(const std::string& chosen);

/// Reads and checks a settings file. A missing one is empty unless `mustExist`. Failure (BadFile)
/// names the file, the line and what to do. The kept file may hold what only the plug-in writes.
SettingTexts ReadSettingFile(const std::string& path, bool mustExist, bool kept);

/// Makes the directory of the kept file when that is missing.
void MakeDirectoryOf(const std::string& path);

/// Writes the kept file. Failure (BadFile).
void WriteKeptSettings(const std::string& path, const SettingTexts& texts);

}  // namespace host
