// The settings that the plug-in asks its host for or leaves with it: one table with the key, the
// meaning, the texts that are accepted and the default.

#pragma once

#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace host {

enum class SettingForm { Switch, Integer, Hex, NonzeroHex, Seconds, Mac, Choice, Published };

struct SettingInfo {
    const char* key;
    SettingForm form;
    const char* defaultText;
    const char* meaning;
    std::vector<const char*> choices = {};  ///< of a Choice
};

std::span<const SettingInfo> SettingCatalogue();

/// The row of a key in any case of its letters, or null.
const SettingInfo* FindSetting(std::string_view key);

/// Whether a setting is the MAC address or a register value of one board. Such a text is never
/// kept, or it would become the input for the next board.
bool IsOfOneBoard(const std::string& key);

/// What to say of a key that has no row.
std::string UnknownSetting(std::string_view key);

/// The accepted texts, for people: "0 or 1", "hexadecimal, up to ffffffff".
std::string AcceptedTexts(const SettingInfo& info);

/// The text as the plug-in takes it, a MAC address brought into the one form that it accepts.
/// Throws std::invalid_argument, with the accepted texts, for a text that the plug-in would refuse
/// or silently read as something else, and for every text of a setting that only it writes.
std::string CheckedText(const SettingInfo& info, const std::string& text);

}  // namespace host
