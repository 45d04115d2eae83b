// Finding, reading and writing the TOML files.

#include "host/settings/SettingFiles.h"

#include <fmt/format.h>
#include <toml++/toml.h>

#include <filesystem>
#include <sstream>
#include <string_view>

#include "base/system/Environment.h"
#include "base/system/Files.h"
#include "base/system/Paths.h"
#include "host/base/Errors.h"
#include "host/files/InputFile.h"
#include "host/files/OutputFile.h"
#include "host/settings/SettingTable.h"

namespace host {

namespace {

constexpr char kCanBeDeleted[] = "; the tool wrote this file and can do without: delete it";

/// A file that can't even be looked at (there is no such directory, or it is somebody else's) is
/// missing.
std::string Contents(const std::string& path, bool mustExist) {
    return mustExist || base::StatusOf(path) ? ReadWholeFile(kSettingsFile, path) : "";
}

}  // namespace

SettingPaths FindSettingPaths(const std::string& chosen) {
    SettingPaths paths;
    paths.userMustExist = !chosen.empty();
    paths.user = chosen;
    if (chosen.empty()) {
        const std::string directory = base::ConfigurationDirectory();
        if (directory.empty()) return paths;
        paths.user = directory + "/corvane-flash/settings.toml";
    }
    const auto status = base::StatusOf(paths.user);
    if (status && status->type != base::FileType::Regular) return paths;
    constexpr std::string_view kExtension = ".toml";
    const bool isToml = paths.user.ends_with(kExtension);
    paths.kept = isToml ? paths.user.substr(0, paths.user.size() - kExtension.size()) + ".kept.toml"
                        : paths.user + ".kept";
    return paths;
}

SettingTexts ReadSettingFile(const std::string& path, bool mustExist, bool kept) {
    if (path.empty()) return {};
    try {
        return SettingsOf(toml::parse(Contents(path, mustExist), path), kept);
    } catch (const TableError& error) {
        throw Failure(ExitStatus::BadFile,
                      fmt::format("settings file {}: line {}: {}{}", path, error.line, error.what(),
                                  kept ? kCanBeDeleted : ""));
    } catch (const toml::parse_error& error) {
        throw Failure(
            ExitStatus::BadFile,
            fmt::format("settings file {}: line {}: {}; write KEY = \"TEXT\"{}", path,
                        error.source().begin.line, error.description(), kept ? kCanBeDeleted : ""));
    }
}

void MakeDirectoryOf(const std::string& path) {
    std::error_code ignored;  // what follows from it is reported by the writing
    std::filesystem::create_directories(base::PathOf(path).parent_path(), ignored);
}

void WriteKeptSettings(const std::string& path, const SettingTexts& texts) {
    toml::table table;
    for (const auto& [key, text] : texts)
        table.insert(key, text);
    std::ostringstream contents;
    contents << "# Written by corvane-flash; values of your own belong into the file beside it.\n"
             << table << '\n';
    WriteWholeFile(kSettingsFile, path, contents.str(), Existing::Replace);
}

}  // namespace host
