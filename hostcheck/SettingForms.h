// The settings that the plug-in reads, and what their texts look like.

#pragma once

#include <span>
#include <string>

namespace hostcheck {

enum class Form { Switch, Integer, Hex, Seconds, Mac, EraseOption, Selection };

struct KnownSetting {
    const char* key;
    Form form;
    bool loadNeedsIt = false;
};

std::span<const KnownSetting> KnownSettings();

/// Whether the plug-in reads the text as what it says, neither refusing it nor taking it for
/// something else.
bool HasForm(Form form, const std::string& text);

/// For people: "0 or 1".
const char* FormText(Form form);

}  // namespace hostcheck
