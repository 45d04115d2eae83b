// Finding, reading and writing the TOML files.

#include "host/settings/SettingFiles.h"

#include <fmt/format.h>
#include <toml++/toml.h>

#include <cstdlib>
#include <filesystem>
#include <optional>
#include <sstream>
#include <stdexcept>

#include "host/base/Errors.h"
#include "host/files/InputFile.h"
#include "host/files/OutputFile.h"
#include "host/settings/SettingCatalogue.h"

namespace host {

namespace {

namespace fs = std::filesystem;

std::string Variable(const char* name) {
    const char* text = std::getenv(name);
    return text == nullptr ? "" : text;
}

std::string ConfigurationDirectory() {
    // Only an absolute path counts, by the rule of the XDG base directories.
    if (std::string xdg = Variable("XDG_CONFIG_HOME"); xdg.starts_with('/')) return xdg;
    if (const std::string home = Variable("HOME"); !home.empty()) return home + "/.config";
    return {};
}

[[noreturn]] void Refuse(const std::string& path, const std::string& why, bool kept) {
    throw Failure(
        ExitStatus::BadFile,
        fmt::format("settings file {}: {}{}", path, why,
                    kept ? "; the tool wrote this file and can do without: delete it" : ""));
}

/// A file that can't even be looked at (there is no such directory, or it is somebody else's) is
/// missing.
std::string Contents(const std::string& path, bool mustExist) {
    std::error_code ignored;
    return mustExist || fs::exists(path, ignored) ? ReadWholeFile(kSettingsFile, path) : "";
}

/// A number is taken where it can mean only one thing: a decimal one for a decimal setting, a
/// hexadecimal one for a hexadecimal setting.
std::optional<std::string> TextOf(const toml::node& node, SettingForm form) {
    if (const auto* text = node.as_string()) return text->get();
    const auto* number = node.as_integer();
    if (form == SettingForm::Switch && node.is_boolean()) return *node.value<bool>() ? "1" : "0";
    if (number == nullptr) return std::nullopt;
    const bool hex =
        (number->flags() & toml::value_flags::format_as_hexadecimal) != toml::value_flags::none;
    if (form == SettingForm::Hex)
        return hex ? std::optional(fmt::format("{:x}", number->get())) : std::nullopt;
    return fmt::format("{}", number->get());
}

std::string ReadEntry(const std::string& key, const toml::node& node, bool kept) {
    const SettingInfo* info = FindSetting(key);
    // The plug-in may keep what this host knows nothing of.
    if (info == nullptr && kept) return node.value_or(std::string());
    if (info == nullptr) throw std::invalid_argument(UnknownSetting(key));
    const auto text = TextOf(node, info->form);
    if (!text)
        throw std::invalid_argument(fmt::format("{} must be a text between quotes; it takes {}",
                                                key, AcceptedTexts(*info)));
    return kept && info->form == SettingForm::Published ? *text : CheckedText(*info, *text);
}

void AddEntry(SettingTexts& texts, const std::string& key, const toml::node& node, bool kept) {
    const std::string text = ReadEntry(key, node, kept);
    const SettingInfo* info = FindSetting(key);
    if (!texts.emplace(info == nullptr ? key : info->key, text).second)
        throw std::invalid_argument(fmt::format("{} is there twice; leave one out", key));
}

}  // namespace

SettingPaths FindSettingPaths(const std::string& chosen) {
    SettingPaths paths;
    paths.userMustExist = !chosen.empty();
    paths.user = chosen;
    if (chosen.empty()) {
        const std::string directory = ConfigurationDirectory();
        if (directory.empty()) return paths;
        paths.user = directory + "/corvane-flash/settings.toml";
    }
    std::error_code ignored;
    if (fs::exists(paths.user, ignored) && !fs::is_regular_file(paths.user, ignored)) return paths;
    paths.kept = fs::path(paths.user).replace_extension(".kept.toml").string();
    return paths;
}

SettingTexts ReadSettingFile(const std::string& path, bool mustExist, bool kept) {
    if (path.empty()) return {};
    SettingTexts texts;
    try {
        const toml::table table = toml::parse(Contents(path, mustExist), path);
        for (const auto& [key, node] : table)
            try {
                AddEntry(texts, std::string(key.str()), node, kept);
            } catch (const std::invalid_argument& error) {
                Refuse(path, fmt::format("line {}: {}", node.source().begin.line, error.what()),
                       kept);
            }
    } catch (const toml::parse_error& error) {
        Refuse(path,
               fmt::format("line {}: {}; write KEY = \"TEXT\"", error.source().begin.line,
                           error.description()),
               kept);
    }
    return texts;
}

void MakeDirectoryOf(const std::string& path) {
    std::error_code ignored;  // what follows from it is reported by the writing
    fs::create_directories(fs::path(path).parent_path(), ignored);
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
