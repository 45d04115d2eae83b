// Hosts whose settings are wrong: their keys, their texts, and what is kept of them; and hosts that
// don't take what is to be shown.

#include <algorithm>
#include <cctype>
#include <cstring>
#include <stdexcept>

#include "tests/hostcheck/CheckedHosts.h"

namespace test {

namespace {

using std::string;
using H = CheckedHost;

/// What becomes of a text on its way into the store.
Spoil Stored(string (*bent)(const string&)) {
    return On(&H::set, [=](auto&, auto& set, auto* name, auto* value) {
        return set(name, bent(value).c_str());
    });
}

/// What is asked for, instead of what the plug-in asks for.
Spoil Asked(string (*bent)(const string&)) {
    return On(&H::get, [=](H& h, auto&, const string& name) {
        const auto found = std::ranges::find(h.settings, bent(name),
                                             [&](const auto& row) { return bent(row.first); });
        return found == h.settings.end() ? nullptr : found->second.c_str();
    });
}

string Upper(const string& text) {
    string upper = text;
    std::ranges::transform(upper, upper.begin(), [](unsigned char c) { return std::toupper(c); });
    return upper;
}

const FaultyHost kFaultySettings[] = {
    {"expected null for a setting that the host hasn't; came \"\" for \"FlashHostC",
     On(&H::get, [](auto&, auto& get, auto* name) { return get(name) ? get(name) : ""; })},
    {"expected null for a setting that the host hasn't; came \"64KB\" for \"\"",
     On(&H::get, [](auto&, auto& get, auto* name) { return *name ? get(name) : "64KB"; })},
    {"setting that the host hasn't; came a pointer that leads to no NUL-terminated text",
     Failing(&H::get, kNoText)},
    {"expected null for a setting that the host hasn't; came an exception: \"no key\"",
     On(&H::get, [](auto&...) -> const char* { throw std::out_of_range("no key"); })},
    {"expected keys compared whole, upper and lower case told apart; came \"0\" for \"F",
     Asked([](const string& key) { return key.substr(0, 16); })},
    {"expected keys compared whole, upper and lower case told apart; came \"0\" for \" ",
     Asked([](const string& key) { return key.substr(key.starts_with(' ')); })},
    {"GetProperty: expected the same text when it is asked twice; came \"3\", then \"4\"",
     On(&H::get,
        [n = 0](H& h, auto& get, auto* name) mutable {
            if (!strcmp(name, "FlashTimeoutValue")) h.settings[name] = std::to_string(++n);
            return get(name);
        })},
    {"GetProperty: expected the same text when it is asked twice; came null, then \"10\"",
     On(&H::get,
        [n = 0](auto&, auto& get, auto* name) mutable {
            return !strcmp(name, "FlashCrystalFreq") && ++n < 4 ? nullptr : get(name);
        })},
    {"expected a text that stays until the next call; came a text that changed",
     On(&H::get,
        [](auto&, auto& get, auto* name) { return get(name) ? Dangling(get(name)) : nullptr; })},
    {"expected null for what the plug-in publishes; came the error text \"no setting",
     On(&H::set,
        [](H& h, auto& set, const string& name, auto* value) {
            const bool known = h.settings.contains(name) || name == "FlashChecksumValue";
            return known ? set(name.c_str(), value) : "no setting";
        })},
    {"the plug-in publishes; came the error text \"empty\" for DeviceInfoFamily as \"\"",
     On(&H::set, [](auto&, auto& set, auto* name,
                    auto* value) { return *value ? set(name, value) : "empty"; })},
    {"expected a copy of the value, which GetProperty returns; came \"?\" after \"1\"",
     On(&H::get, [](auto&, auto& get,
                    auto* name) { return strcmp(name, "FlashChecksumValue") ? get(name) : "?"; })},
    {"expected a copy of the value, which GetProperty returns; came \"89ABCDEF\" after",
     Stored(Upper)},
    {"expected a copy of the value, which GetProperty returns; came \"89\" after",
     Stored([](const string& value) {
         return std::isdigit(value[0]) ? std::to_string(std::stoi(value)) : value;
     })},
    {"expected a copy of the value, which GetProperty returns; came \"Tolva\" after",
     Stored([](const string& value) { return value.substr(0, value.find(' ')); })},
    {"SetProperty: expected a copy of the value, which GetProperty returns; came \"?",
     On(&H::set,
        [](H& h, auto&, auto* name, auto* value) {
            static const char* pointer = nullptr;
            pointer = value;
            On(&H::get, [](auto&, auto& get, auto* key) {
                return strcmp(key, "FlashChecksumValue") ? get(key) : pointer;
            })(h);
            h.settings[name];
            return nullptr;
        })},
    {"SetProperty: expected a value of 40 characters kept whole; came \"7777",
     Stored([](const string& value) { return value.substr(0, 31); })},
    {"expected no change of another setting; came another value for FlashChecksumSele",
     On(&H::set,
        [](auto&, auto& set, auto* name, const string& value) {
            if (value == "13579bdf") set("FlashChecksumSelection", "By Address Range");
            return set(name, value.c_str());
        })},
};

const FaultyHost kFaultyDisplays[] = {
    {"expected null for a text with percent signs and UTF-8; came the error text \"no",
     On(&H::message, [](auto&, auto&, auto* text) { return strchr(text, '%') ? "no" : nullptr; })},
    {"expected null for a text of 300 characters; came the error text \"too long\"",
     On(&H::message,
        [](auto&, auto&, auto* text) { return strlen(text) > 299 ? "too long" : nullptr; })},
    {"ShowMessage: expected null for \"ReadMemory: ok: the identification",
     On(&H::message,
        [](auto&, auto&, auto* text) { return strstr(text, "ok") ? throw 1 : nullptr; })},
    {"UpdateProgress: expected null for 0 to 100 percent; came an exception",
     On(&H::update, [](auto&...) -> const char* { throw 1; })},
    {"UpdateProgress: expected null for 0 to 100 percent; came the error text \"full\"",
     On(&H::update, [n = 0](auto&...) mutable { return ++n > 100 ? "full" : nullptr; })},
    {"expected null for fewer percent than before; came the error text \"back\"",
     On(&H::update, [n = 0](auto&...) mutable { return ++n == 103 ? "back" : nullptr; })},
    {"EndProgress: expected null; came the error text \"no\"",
     On(&H::end, [](H& h, auto&) { return --h.displaysOpen, "no"; })},
    {"expected further displays after the first; came the error text \"once\"",
     On(&H::begin, [n = 0](auto&, auto& begin) mutable { return ++n > 5 ? "once" : begin(); })},
};

}  // namespace

std::span<const FaultyHost> FaultySettings() {
    return kFaultySettings;
}
std::span<const FaultyHost> FaultyDisplays() {
    return kFaultyDisplays;
}

}  // namespace test
