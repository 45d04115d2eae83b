// Settings: what the host answers for keys it has and for keys it can't have, and whether it keeps
// what it is given.

#include <algorithm>

#include "device/SettingKeys.h"
#include "hostcheck/Checks.h"
#include "hostcheck/SettingForms.h"

namespace hostcheck {

namespace {

std::string UnknownIsNull(CheckedHost& host) {
    for (const char* name : {"FlashHostCheckUnknown", ""})
        if (const auto value = host.Get(name))
            throw Breach(Quoted(*value) + " for " + Quoted(name));
    return "";
}

std::string CaseMatters(CheckedHost& host) {
    if (const auto value = host.Get("flashresetsetting"))
        throw Breach(Quoted(*value) + " for \"flashresetsetting\"");
    return "";
}

std::string LoadSettingsAreKnown(CheckedHost& host) {
    std::string missing;
    for (const KnownSetting& setting : KnownSettings())
        if (setting.loadNeedsIt && !host.Get(setting.key))
            missing += std::string(" ") + setting.key;
    if (!missing.empty()) throw Breach("null for" + missing);
    return "";
}

std::string ValuesHaveTheirForm(CheckedHost& host) {
    std::string missing;
    for (const KnownSetting& setting : KnownSettings()) {
        const auto value = host.Get(setting.key);
        if (!value)
            missing += std::string(" ") + setting.key;
        else if (!HasForm(setting.form, *value))
            throw Breach(Quoted(*value) + " for " + setting.key + ", which takes " +
                         FormText(setting.form));
    }
    return missing.empty() ? "" : "unknown here, so that what needs them fails:" + missing;
}

// The plug-in asks twice, and uses what comes the second time.
std::string SameTwice(CheckedHost& host) {
    for (const KnownSetting& setting : KnownSettings()) {
        const auto first = host.Get(setting.key);
        const auto second = host.Get(setting.key);
        if (first != second)
            throw Breach(Quoted(first.value_or("null")) + ", then " +
                         Quoted(second.value_or("null")) + " for " + setting.key);
    }
    return "";
}

// Memory that the host has given back is soon somebody else's; here it is asked for at once.
std::string ValueStays(CheckedHost& host) {
    for (const KnownSetting& setting : KnownSettings()) {
        const char* value = host.Called([&](IFlashHost& h) { return h.GetProperty(setting.key); });
        const auto first = CheckedHost::Text(value);
        if (!first) continue;
        const std::vector<std::string> others(64, std::string(first->size(), '#'));
        if (CheckedHost::Text(value) != first)
            throw Breach("a text that changed without a call, for " + std::string(setting.key));
    }
    return "";
}

/// Stores a value out of memory that is overwritten afterwards, and looks for it.
void RequireKept(CheckedHost& host, const std::string& name, const std::string& value) {
    std::string nameMemory = name;
    std::string valueMemory = value;
    host.Set(nameMemory, valueMemory);
    std::fill(nameMemory.begin(), nameMemory.end(), '?');
    std::fill(valueMemory.begin(), valueMemory.end(), '?');
    const auto came = host.Get(name);
    if (came == value) return;
    throw Breach((came ? Quoted(*came) : "null") + " after " + Quoted(value) + " was set for " +
                 name);
}

// The one setting that nobody but the plug-in writes, and that means nothing between two runs.
std::string KeepsWhatIsSet(CheckedHost& host) {
    const std::string before = host.Get(Setting::FlashChecksumValue).value_or("--");
    for (const char* value : {"1", "89abcdef", "--"})
        RequireKept(host, Setting::FlashChecksumValue, value);
    host.Set(Setting::FlashChecksumValue, before);
    return "";
}

std::string KeepsLongTexts(CheckedHost& host) {
    const std::string before = host.Get(Setting::FlashChecksumValue).value_or("--");
    RequireKept(host, Setting::FlashChecksumValue, std::string(255, '7'));
    host.Set(Setting::FlashChecksumValue, before);
    return "";
}

constexpr Check kSettingChecks[] = {
    {Stage::Initialize, "GetProperty", "null for a setting that the host hasn't", UnknownIsNull},
    {Stage::Initialize, "GetProperty", "keys told apart by upper and lower case", CaseMatters},
    {Stage::Initialize, "GetProperty", "a value for each setting that a load needs",
     LoadSettingsAreKnown},
    {Stage::Initialize, "GetProperty", "values that the plug-in can read", ValuesHaveTheirForm},
    {Stage::Initialize, "GetProperty", "the same text when it is asked twice", SameTwice},
    {Stage::Initialize, "GetProperty", "a text that stays until the next call", ValueStays},
    {Stage::Initialize, "SetProperty", "a copy of the value, which GetProperty returns",
     KeepsWhatIsSet},
    {Stage::Initialize, "SetProperty", "a value of 255 characters kept whole", KeepsLongTexts},
};

}  // namespace

std::span<const Check> SettingChecks() {
    return kSettingChecks;
}

}  // namespace hostcheck
