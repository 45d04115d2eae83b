// The layers of settings, and how the store of a run is filled.

#include "host/settings/SettingStore.h"

#include <fmt/format.h>

#include <stdexcept>
#include <string_view>

#include "base/system/Environment.h"
#include "host/base/Errors.h"
#include "host/base/MacAddress.h"
#include "host/facts/SettingKeys.h"

namespace host {

namespace {

constexpr std::string_view kEnvironmentPrefix = "CORVANE_SET_";

}  // namespace

void SettingStore::Set(Origin origin, const std::string& key, const std::string& text) {
    Layer(origin)[key] = text;
}

void SettingStore::SetUnlessChosen(const std::string& key, const std::string& text) {
    if (Get(key).origin >= Origin::Kept) Set(Origin::CommandLine, key, text);
}

void SettingStore::Keep(const std::string& key, const std::string& text) {
    if (Kept(key) == text) return;
    Layer(Origin::Kept)[key] = text;
    changed_[key] = true;
}

void SettingStore::Publish(const std::string& key, const std::string& text) {
    const auto mac = key == keys::kMacInput ? ParseMacAddress(text) : std::nullopt;
    published_[key] = mac ? mac->Text() : text;
    if (!IsOfOneBoard(key)) Keep(key, text);
}

std::string SettingStore::Published(const std::string& key) const {
    const auto found = published_.find(key);
    return found == published_.end() ? "" : found->second;
}

SettingValue SettingStore::Get(const std::string& key) const {
    for (std::size_t layer = 0; layer < layers_.size(); ++layer)
        if (const auto found = layers_[layer].find(key); found != layers_[layer].end())
            return {found->second, static_cast<Origin>(layer)};
    const SettingInfo* info = FindSetting(key);
    return {info == nullptr ? "" : info->defaultText, Origin::Default};
}

std::string SettingStore::Kept(const std::string& key) const {
    const SettingTexts& kept = layers_[static_cast<std::size_t>(Origin::Kept)];
    const auto found = kept.find(key);
    return found == kept.end() ? "" : found->second;
}

void SettingStore::Forget(const std::string& key) {
    if (Layer(Origin::Kept).erase(key) != 0) changed_[key] = false;
}

void SettingStore::Save(const WaitNotice& say) {
    if (changed_.empty()) return;
    if (paths_.kept.empty())
        throw Failure(
            ExitStatus::BadFile,
            paths_.user.empty()
                ? fmt::format("no place to keep settings: {}; name a file with --settings",
                              base::kNoConfigurationDirectory)
                : fmt::format("no place to keep settings: {} is no regular file; name another with "
                              "--settings",
                              paths_.user));
    MakeDirectoryOf(paths_.kept);
    const FileLock lock(kSettingsFile, paths_.kept, say);
    SettingTexts texts = ReadSettingFile(paths_.kept, false, true);
    for (const auto& [key, present] : changed_) {
        if (present)
            texts[key] = Kept(key);
        else
            texts.erase(key);
    }
    WriteKeptSettings(paths_.kept, texts);
    changed_.clear();
}

std::string OriginText(Origin origin, const SettingPaths& paths) {
    if (origin == Origin::UserFile) return paths.user;
    if (origin == Origin::Project) return paths.project;
    constexpr const char* names[] = {"command line", "environment", "", "",
                                     "kept value",   "default"};
    return names[static_cast<std::size_t>(origin)];
}

std::string EnvironmentName(const std::string& key) {
    return std::string(kEnvironmentPrefix) + key;
}

const SettingInfo& RequireSetting(std::string_view key, std::string_view where) {
    if (const SettingInfo* info = FindSetting(key)) return *info;
    throw Failure(ExitStatus::WrongUsage, fmt::format("{}: {}", where, UnknownSetting(key)));
}

std::string RequireText(const SettingInfo& info, const std::string& text,
                        const std::string& where) {
    try {
        return CheckedText(info, text);
    } catch (const std::invalid_argument& error) {
        throw Failure(ExitStatus::WrongUsage, fmt::format("{}: {}", where, error.what()));
    }
}

namespace {

/// One "KEY=TEXT"; `where` is what it stands behind.
void Assign(SettingStore& store, Origin origin, const std::string& assignment,
            const std::string& where) {
    const auto equals = assignment.find('=');
    if (equals == std::string::npos)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{} {}: write KEY=TEXT", where, assignment));
    const SettingInfo& info = RequireSetting(assignment.substr(0, equals), where);
    store.Set(origin, info.key, RequireText(info, assignment.substr(equals + 1), where));
}

}  // namespace

SettingStore LoadSettings(const std::string& settingsFile,
                          const std::vector<std::string>& assignments,
                          const ProjectSettings& project) {
    SettingPaths paths = FindSettingPaths(settingsFile);
    paths.project = project.path;
    SettingStore store(paths);
    for (const auto& [key, text] : project.texts)
        store.Set(Origin::Project, key, text);
    for (const auto& [key, text] : ReadSettingFile(paths.user, paths.userMustExist, false))
        store.Set(Origin::UserFile, key, text);
    for (const auto& [key, text] : ReadSettingFile(paths.kept, false, true))
        if (!IsOfOneBoard(key)) store.Set(Origin::Kept, key, text);
    for (const std::string& text : base::EnvironmentVariables())
        if (text.starts_with(kEnvironmentPrefix))
            Assign(store, Origin::Environment, text.substr(kEnvironmentPrefix.size()),
                   "environment variable " + text.substr(0, text.find('=')));
    for (const std::string& assignment : assignments)
        Assign(store, Origin::CommandLine, assignment, "--set");
    return store;
}

}  // namespace host
