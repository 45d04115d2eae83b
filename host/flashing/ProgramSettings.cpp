// Reading a request from the settings, and writing a plan to them: the only place that does.

#include "host/flashing/ProgramSettings.h"

#include <algorithm>
#include <cstdlib>
#include <limits>

#include "host/facts/SettingKeys.h"
#include "host/settings/RangeSettings.h"

namespace host {

namespace {

using Kind = EraseChoice::Kind;

EraseChoice RequestedErase(const SettingStore& settings) {
    const std::string option = settings.Text(keys::kProgramOption);
    if (option == keys::kNecessaryPages) return {Kind::Necessary};
    if (option == keys::kNoErase) return {Kind::Nothing};
    const auto range = SelectedRange(settings, kEraseKeys);
    return range ? EraseChoice{Kind::Range, *range} : EraseChoice{Kind::Everything};
}

bool IsOn(const SettingStore& settings, const char* key) {
    return settings.Text(key).ends_with('1');
}

/// The whole seconds that a text begins with; what the plug-in refuses is no time.
std::chrono::seconds Seconds(const std::string& text) {
    const auto number = std::strtoll(text.c_str(), nullptr, 10);
    return std::chrono::seconds(std::clamp<long long>(number, 0, std::numeric_limits<int>::max()));
}

void Choose(SettingStore& settings, const char* key, const std::string& text) {
    settings.Set(Origin::CommandLine, key, text);
}

void ChooseErase(SettingStore& settings, const EraseChoice& erase) {
    if (RequestedErase(settings) == erase) return;
    if (erase.kind == Kind::Necessary)
        return Choose(settings, keys::kProgramOption, keys::kNecessaryPages);
    if (erase.kind == Kind::Nothing) return Choose(settings, keys::kProgramOption, keys::kNoErase);
    Choose(settings, keys::kProgramOption, keys::kEraseOptions);
    const bool whole = erase.kind == Kind::Everything;
    SelectRange(settings, kEraseKeys, whole ? std::nullopt : std::optional(erase.range));
}

void ChooseSwitch(SettingStore& settings, const char* key, bool on) {
    if (IsOn(settings, key) != on) Choose(settings, key, on ? "1" : "0");
}

}  // namespace

LoadRequest RequestedLoad(const SettingStore& settings) {
    const SettingValue time = settings.Get(keys::kTimeout);
    return {.erase = RequestedErase(settings),
            .checks = {.blankCheck = IsOn(settings, keys::kProgramBlankCheck),
                       .checksum = IsOn(settings, keys::kProgramCrc)},
            .time = {Seconds(time.text), time.origin != Origin::Default}};
}

void WriteProgramSettings(SettingStore& settings, const LoadPlan& plan) {
    ChooseErase(settings, plan.erase);
    ChooseSwitch(settings, keys::kProgramBlankCheck, plan.checks.blankCheck);
    ChooseSwitch(settings, keys::kProgramCrc, plan.checks.checksum);
    if (plan.sectionTime != Seconds(settings.Text(keys::kTimeout)))
        Choose(settings, keys::kTimeout, std::to_string(plan.sectionTime.count()));
}

}  // namespace host
