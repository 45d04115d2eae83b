// Values with a structure of their own are offered piece by piece: KEY=TEXT, CLASS,OPTION=VALUE.

#include "host/cli/OfferedValues.h"

#include <algorithm>

#include "host/base/Errors.h"
#include "host/settings/ProjectFile.h"
#include "host/settings/SettingCatalogue.h"
#include "target/gdb/client/GdbOptions.h"
#include "target/simulated/options/DeviceOptions.h"
#include "target/simulated/options/OptionTable.h"

namespace host {

namespace {

using Words = std::vector<Completions::Word>;

Words SettingTexts(const std::string& key) {
    Words words;
    const SettingInfo* info = FindSetting(key);
    if (info == nullptr) return words;
    for (const char* choice : info->choices)
        words.push_back({key + "=" + choice, ""});
    if (info->form == SettingForm::Switch)
        for (const char* state : {"=0", "=1"})
            words.push_back({key + state, info->meaning});
    return words;
}

Words Settings(const std::string& typed, bool assignment) {
    if (const auto equals = typed.find('='); equals != std::string::npos)
        return SettingTexts(typed.substr(0, equals));
    Words words;
    for (const SettingInfo& info : SettingCatalogue())
        if (!assignment || info.form != SettingForm::Published)
            words.push_back({std::string(info.key) + (assignment ? "=" : ""), info.meaning});
    return words;
}

Words Classes() {
    Words words;
    for (const std::string& name : target::DeviceClassNames())
        words.push_back({name, ""});
    return words;
}

Words Boards() try {
    Words words;
    for (const auto& [name, board] : ReadNearestProject().boards)
        words.push_back({name, ""});
    return words;
} catch (const Failure&) {
    return {};  // a command that needs the file will say what is wrong with it
}

Words Devices(const std::string& typed) {
    const auto comma = typed.rfind(',');
    if (comma == std::string::npos) return Classes();
    Words words;
    const std::string before = typed.substr(0, comma + 1);
    const auto equals = typed.find('=', comma);
    for (const target::OptionRow& row : target::OptionTable()) {
        const std::string assignment = std::string(row.name) + "=";
        if (equals == std::string::npos) {
            if (before.find("," + assignment) == std::string::npos)
                words.push_back({before + assignment, row.meaning});
        } else if (typed.substr(comma + 1, equals - comma) == assignment) {
            for (const char* word : row.words)
                words.push_back({before + assignment + word, ""});
        }
    }
    return words;
}

Words GdbOptions(const std::string& typed) {
    Words words;
    const std::string before = typed.substr(0, typed.rfind(',') + 1);
    for (const target::gdb::GdbOptionRow& option : target::gdb::GdbOptionTable())
        words.push_back({before + option.name + "=", option.meaning});
    return words;
}

Words Values(const OptionRow& row, const std::string& typed) {
    switch (row.offers) {
        case Offers::Devices:
            return Devices(typed);
        case Offers::Boards:
            return Boards();
        case Offers::Classes:
            return Classes();
        case Offers::GdbOptions:
            return GdbOptions(typed);
        case Offers::Settings:
            return Settings(typed, false);
        case Offers::SettingAssignments:
            return Settings(typed, true);
        default:
            break;
    }
    Words words;
    for (const std::string& choice : row.choices)
        words.push_back({choice, ""});
    return words;
}

}  // namespace

Completions OfferedValues(const OptionRow& row, const std::string& before,
                          const std::string& typed) {
    Completions offered{Values(row, typed), {}};
    for (Completions::Word& word : offered.words)
        word.text.insert(0, before);
    if (row.offers == Offers::Files) offered.filesBehind = before;
    return offered;
}

}  // namespace host
