// Hosts whose settings are wrong: their keys, their texts, and what is kept of them.

#include <algorithm>
#include <cctype>
#include <cstring>
#include <stdexcept>

#include "tests/hostcheck/CheckedHosts.h"

namespace test {

namespace {

using std::string;

/// What becomes of a text on its way into the store.
void Bend(CheckedHost& host, string (*bent)(const string&)) {
    host.set = [&host, bent](const char* name, const char* value) {
        host.settings[name] = bent(value);
        return nullptr;
    };
}

/// What is asked for, instead of what the plug-in asks for.
void BendKeys(CheckedHost& host, string (*bent)(const string&)) {
    host.get = [&host, bent](const char* name) {
        const auto found = std::ranges::find(host.settings, bent(name),
                                             [&](const auto& row) { return bent(row.first); });
        return found == host.settings.end() ? nullptr : found->second.c_str();
    };
}

const FaultyHost kFaultySettings[] = {
    {R"(GetProperty: expected null for a setting that the host hasn't; came "" for "FlashHostC)",
     [](CheckedHost& h) {
         h.get = [get = h.get](const char* name) { return get(name) ? get(name) : ""; };
     }},
    {R"(GetProperty: expected null for a setting that the host hasn't; came "64KB" for "")",
     [](CheckedHost& h) {
         h.get = [get = h.get](const char* name) { return *name == '\0' ? "64KB" : get(name); };
     }},
    {"GetProperty: expected null for a setting that the host hasn't; came a pointer that leads to "
     "no NUL-terminated text",
     [](CheckedHost& h) { Fail(h.get, kNoText); }},
    {"GetProperty: expected null for a setting that the host hasn't; came an exception: \"no key\"",
     [](CheckedHost& h) {
         h.get = [](const char*) -> const char* { throw std::out_of_range("no key"); };
     }},
    {"GetProperty: expected keys compared whole, upper and lower case told apart; came \"0\" for "
     "\"flashresetsetting\"",
     [](CheckedHost& h) { h.settings["flashresetsetting"] = "0"; }},
    {R"(GetProperty: expected keys compared whole, upper and lower case told apart; came "0" for "F)",
     [](CheckedHost& h) { BendKeys(h, [](const string& key) { return key.substr(0, 16); }); }},
    {R"(GetProperty: expected keys compared whole, upper and lower case told apart; came "0" for " )",
     [](CheckedHost& h) {
         BendKeys(h, [](const string& key) {
             return key.substr(std::min(key.find_first_not_of(' '), key.size()));
         });
     }},
    {"GetProperty: expected a value for each setting that a load reads; came null for FlashTimeout",
     [](CheckedHost& h) { h.settings.erase("FlashTimeoutValue"); }},
    {"GetProperty: expected a value for each setting that a load reads; came null for "
     "FlashProgramOption FlashProgramBlankCheckOption FlashProgramCRCOption\n",
     [](CheckedHost& h) {
         std::erase_if(h.settings,
                       [](const auto& row) { return row.first.starts_with("FlashProgram"); });
     }},
    {"GetProperty: expected a value for each setting that Erase reads; came null for "
     "FlashEraseType FlashEraseEndAddr\n",
     [](CheckedHost& h) {
         h.settings.erase("FlashEraseType");
         h.settings.erase("FlashEraseEndAddr");
     }},
    {"GetProperty: expected a value for each setting that BlankCheck reads; came null for "
     "FlashBlankCheckSelection\n",
     [](CheckedHost& h) { h.settings.erase("FlashBlankCheckSelection"); }},
    {"GetProperty: expected a value for each setting that CalculateChecksum reads; came null for "
     "FlashChecksumStartAddr\n",
     [](CheckedHost& h) { h.settings.erase("FlashChecksumStartAddr"); }},
    {"GetProperty: expected a value for each setting that ProgramUserRegister0 reads; came null "
     "for FlashUserRegister0Commit\n",
     [](CheckedHost& h) { h.settings.erase("FlashUserRegister0Commit"); }},
    {"GetProperty: expected a value for each setting that ProgramUserRegister1 reads; came null "
     "for FlashUserRegister1Input\n",
     [](CheckedHost& h) { h.settings.erase("FlashUserRegister1Input"); }},
    {"GetProperty: expected a value for each setting that ProgramMACAddress reads; came null for "
     "FlashMACAddrCommit\n",
     [](CheckedHost& h) { h.settings.erase("FlashMACAddrCommit"); }},
    {R"(GetProperty: expected values that the plug-in can read; came "yes" for FlashProgramCRCOption,)"
     R"( which takes 0 or 1; "later" for FlashTimeoutValue, which takes a whole decimal number of )",
     [](CheckedHost& h) {
         h.settings["FlashProgramCRCOption"] = "yes";
         h.settings["FlashTimeoutValue"] = "later";
     }},
    {R"(GetProperty: expected the same text when it is asked twice; came "3", then "4")",
     [](CheckedHost& h) {
         h.get = [&h, count = 0, get = h.get](const char* name) mutable {
             if (string(name) == "FlashTimeoutValue") h.settings[name] = std::to_string(++count);
             return get(name);
         };
     }},
    {R"(GetProperty: expected the same text when it is asked twice; came null, then "10")",
     [](CheckedHost& h) {
         h.get = [count = 0, get = h.get](const char* name) mutable {
             const bool crystal = string(name) == "FlashCrystalFreq";
             return crystal && ++count < 4 ? nullptr : get(name);
         };
     }},
    {"GetProperty: expected a text that stays until the next call; came a text that changed",
     [](CheckedHost& h) {
         h.get = [get = h.get](const char* name) {
             return get(name) == nullptr ? nullptr : Dangling(get(name));
         };
     }},
    {"SetProperty: expected null for what the plug-in publishes; came the error text \"no setting",
     [](CheckedHost& h) {
         h.set = [&h](const char* name, const char* value) {
             if (!h.settings.contains(name) && strcmp(name, "FlashChecksumValue") != 0)
                 return "no setting";
             h.settings[name] = value;
             return static_cast<const char*>(nullptr);
         };
     }},
    {"SetProperty: expected null for what the plug-in publishes; came the error text \"empty\" for "
     "DeviceInfoFamily as \"\"",
     [](CheckedHost& h) {
         h.set = [set = h.set](const char* name, const char* value) {
             return *value == '\0' ? "empty" : set(name, value);
         };
     }},
    {R"(SetProperty: expected a copy of the value, which GetProperty returns; came "?" after "1")",
     [](CheckedHost& h) {
         h.get = [get = h.get](const char* name) {
             return string(name) == "FlashChecksumValue" ? "?" : get(name);
         };
     }},
    {"SetProperty: expected a copy of the value, which GetProperty returns; came null after \"1\"",
     [](CheckedHost& h) { Fail(h.set, nullptr); }},
    {R"(SetProperty: expected a copy of the value, which GetProperty returns; came "89ABCDEF" after)",
     [](CheckedHost& h) {
         Bend(h, [](const string& value) {
             string upper = value;
             for (char& c : upper)
                 c = static_cast<char>(std::toupper(c));
             return upper;
         });
     }},
    {R"(SetProperty: expected a copy of the value, which GetProperty returns; came "89" after)",
     [](CheckedHost& h) {
         Bend(h, [](const string& value) {
             return std::isdigit(value[0]) ? std::to_string(std::stoi(value)) : value;
         });
     }},
    {R"(SetProperty: expected a copy of the value, which GetProperty returns; came "Tolva" after)",
     [](CheckedHost& h) {
         Bend(h, [](const string& value) { return value.substr(0, value.find(' ')); });
     }},
    {"SetProperty: expected a copy of the value, which GetProperty returns; came \"?",
     [](CheckedHost& h) {
         h.set = [&h](const char* name, const char* value) {
             static const char* pointer = nullptr;
             pointer = value;
             h.get = [get = h.get](const char* key) {
                 return string(key) == "FlashChecksumValue" ? pointer : get(key);
             };
             h.settings[name];
             return nullptr;
         };
     }},
    {"SetProperty: expected a value of 40 characters kept whole; came \"7777",
     [](CheckedHost& h) { Bend(h, [](const string& value) { return value.substr(0, 31); }); }},
    {"SetProperty: expected no change of another setting; came another value for FlashChecksumSele",
     [](CheckedHost& h) {
         h.set = [set = h.set](const char* name, const char* value) {
             if (string(name) == "FlashChecksumValue" && string(value) == "13579bdf")
                 set("FlashChecksumSelection", "By Address Range");
             return set(name, value);
         };
     }},
};

}  // namespace

std::span<const FaultyHost> FaultySettings() {
    return kFaultySettings;
}

}  // namespace test
