// What people write for a setting: a text, or a number or a truth value where it can mean one
// thing.

#include "host/settings/SettingTable.h"

#include <fmt/format.h>

#include <optional>
#include <string>

#include "host/settings/SettingCatalogue.h"

namespace host {

namespace {

/// A number is taken where it can mean only one thing: a decimal one for a decimal setting, a
/// hexadecimal one for a hexadecimal setting.
std::optional<std::string> TextOf(const toml::node& node, SettingForm form) {
    if (const auto* text = node.as_string()) return text->get();
    const auto* number = node.as_integer();
    if (form == SettingForm::Switch && node.is_boolean()) return *node.value<bool>() ? "1" : "0";
    if (number == nullptr) return std::nullopt;
    const bool hex =
        (number->flags() & toml::value_flags::format_as_hexadecimal) != toml::value_flags::none;
    if (form == SettingForm::Hex || form == SettingForm::NonzeroHex)
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

SettingTexts SettingsOf(const toml::table& table, bool kept) {
    SettingTexts texts;
    for (const auto& [key, node] : table)
        try {
            AddEntry(texts, std::string(key.str()), node, kept);
        } catch (const std::invalid_argument& error) {
            throw TableError(node, error.what());
        }
    return texts;
}

}  // namespace host
