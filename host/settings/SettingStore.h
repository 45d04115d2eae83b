// The settings as the plug-in sees them: for each key the value of the first layer that has one.

#pragma once

#include <array>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "host/files/FileLock.h"
#include "host/settings/SettingCatalogue.h"
#include "host/settings/SettingFiles.h"

namespace host {

/// The layers, the strongest first.
enum class Origin { CommandLine, Environment, Project, UserFile, Kept, Default };

struct SettingValue {
    std::string text;
    Origin origin;

    bool operator==(const SettingValue&) const = default;
};

class SettingStore {
  public:
    /// An empty store: every value is the default.
    SettingStore() = default;
    explicit SettingStore(SettingPaths paths) : paths_(std::move(paths)) {}

    /// Puts a checked text into a layer.
    void Set(Origin origin, const std::string& key, const std::string& text);

    /// The same where no layer above the kept values has one.
    void SetUnlessChosen(const std::string& key, const std::string& text);

    /// Leaves a text for later runs; the key need not be a known one.
    void Keep(const std::string& key, const std::string& text);

    /// What the plug-in publishes: kept, unless it stands for one board alone. A MAC address is
    /// padded to two digits a byte.
    void Publish(const std::string& key, const std::string& text);

    /// What was published under the key since the last drop; empty if nothing. What the device is
    /// said to hold is read from here, never from what an earlier run has kept.
    std::string Published(const std::string& key) const;
    void DropPublished() { published_.clear(); }

    /// The key must be one of the catalogue.
    SettingValue Get(const std::string& key) const;
    std::string Text(const std::string& key) const { return Get(key).text; }

    /// What was kept last under the key, whatever stands above it; empty if nothing.
    std::string Kept(const std::string& key) const;

    /// Drops the kept value.
    void Forget(const std::string& key);

    /// Writes the kept file if something was kept that it doesn't hold, joined with what other
    /// runs have kept there meanwhile; `say` is told when one of them must be waited for. Failure
    /// (BadFile).
    void Save(const WaitNotice& say);

    const SettingPaths& Paths() const { return paths_; }

  private:
    SettingTexts& Layer(Origin origin) { return layers_[static_cast<std::size_t>(origin)]; }

    SettingPaths paths_;
    std::array<SettingTexts, 5> layers_;
    SettingTexts published_;
    std::map<std::string, bool> changed_;  ///< kept keys since loading; false: forgotten
};

/// "command line", "environment", the project's file, the user's, "kept value", "default".
std::string OriginText(Origin origin, const SettingPaths& paths);

/// The environment variable that holds a setting's value: "CORVANE_SET_" and the key.
std::string EnvironmentName(const std::string& key);

/// What a project file says for a run.
struct ProjectSettings {
    std::string path;
    SettingTexts texts;
};

/// The store of a run: both files, the project's texts, the environment, and the KEY=TEXT
/// assignments of the command line. Failure (BadFile or WrongUsage) names the key and where it
/// stands.
SettingStore LoadSettings(const std::string& settingsFile,
                          const std::vector<std::string>& assignments,
                          const ProjectSettings& project = {});

/// The row of the catalogue; Failure (WrongUsage) for an unknown key, beginning with `where`.
const SettingInfo& RequireSetting(std::string_view key, std::string_view where);

/// CheckedText with a Failure (WrongUsage) that begins with `where`.
std::string RequireText(const SettingInfo& info, const std::string& text, const std::string& where);

}  // namespace host
