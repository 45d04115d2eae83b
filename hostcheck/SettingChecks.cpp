// GetProperty: what the host answers for keys that it has and for keys that it can't have.

#include "device/SettingKeys.h"
#include "hostcheck/Checks.h"
#include "hostcheck/KnownSettings.h"

namespace hostcheck {

namespace {

void RequireUnknown(CheckedHost& host, const char* name) {
    if (const auto value = host.Get(name)) throw Breach(Quoted(*value) + " for " + Quoted(name));
}

std::string UnknownIsNull(CheckedHost& host) {
    for (const char* name : {"FlashHostCheckUnknown", ""})
        RequireUnknown(host, name);
    return "";
}

// A host that looks for the beginning of a name, or for less of it, takes one key for another.
std::string KeysAreComparedWhole(CheckedHost& host) {
    for (const char* name :
         {"FlashResetSettin", "FlashResetSetting0", " FlashResetSetting", "flashresetsetting"})
        RequireUnknown(host, name);
    return "";
}

template <Use use>
std::string KnowsWhatIsRead(CheckedHost& host) {
    std::string missing;
    for (const KnownSetting& setting : KnownSettings())
        if ((setting.uses & use) != 0 && !host.Get(setting.key))
            missing += std::string(" ") + setting.key;
    if (!missing.empty()) throw Breach("null for" + missing);
    return "";
}

std::string ValuesHaveTheirForm(CheckedHost& host) {
    std::string wrong;
    for (const KnownSetting& setting : KnownSettings()) {
        const auto value = host.Get(setting.key);
        if (value && !HasForm(setting.form, *value))
            wrong += (wrong.empty() ? "" : "; ") + Quoted(*value) + " for " + setting.key +
                     ", which takes " + FormText(setting.form);
    }
    if (!wrong.empty()) throw Breach(wrong);
    return host.Get(Setting::FlashCrystalFreq) ? ""
                                               : "FlashCrystalFreq is unknown, so flash timing on "
                                                 "Ravik, Tolva and Mesk is for 8 MHz";
}

// The plug-in asks twice, and uses what comes the second time.
std::string SameTwice(CheckedHost& host) {
    for (const KnownSetting& setting : KnownSettings()) {
        const auto first = host.Get(setting.key);
        const auto second = host.Get(setting.key);
        if (first != second)
            throw Breach((first ? Quoted(*first) : "null") + ", then " +
                         (second ? Quoted(*second) : "null") + " for " + setting.key);
    }
    return "";
}

std::string ValueStays(CheckedHost& host) {
    for (const KnownSetting& setting : KnownSettings())
        host.AskForAWhile([&](IFlashHost& h) { return h.GetProperty(setting.key); });
    return "";
}

constexpr Check kSettingChecks[] = {
    {Stage::Initialize, "GetProperty", "null for a setting that the host hasn't", UnknownIsNull},
    {Stage::Initialize, "GetProperty", "keys compared whole, upper and lower case told apart",
     KeysAreComparedWhole},
    {Stage::Initialize, "GetProperty", "a value for each setting that a load reads",
     KnowsWhatIsRead<kLoad>},
    {Stage::Initialize, "GetProperty", "a value for each setting that Erase reads",
     KnowsWhatIsRead<kErase>},
    {Stage::Initialize, "GetProperty", "a value for each setting that BlankCheck reads",
     KnowsWhatIsRead<kBlankCheck>},
    {Stage::Initialize, "GetProperty", "a value for each setting that CalculateChecksum reads",
     KnowsWhatIsRead<kChecksum>},
    {Stage::Initialize, "GetProperty", "a value for each setting that ProgramUserRegister0 reads",
     KnowsWhatIsRead<kProgramRegister0>},
    {Stage::Initialize, "GetProperty", "a value for each setting that ProgramUserRegister1 reads",
     KnowsWhatIsRead<kProgramRegister1>},
    {Stage::Initialize, "GetProperty", "a value for each setting that ProgramMACAddress reads",
     KnowsWhatIsRead<kProgramMac>},
    {Stage::Initialize, "GetProperty", "values that the plug-in can read", ValuesHaveTheirForm},
    {Stage::Initialize, "GetProperty", "the same text when it is asked twice", SameTwice},
    {Stage::Initialize, "GetProperty", "a text that stays until the next call", ValueStays},
};

}  // namespace

std::span<const Check> SettingChecks() {
    return kSettingChecks;
}

}  // namespace hostcheck
