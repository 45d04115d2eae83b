// The settings that the plug-in reads: the form of their texts, and what fails without them.

#pragma once

#include <span>
#include <string>

namespace hostcheck {

enum class Form { Switch, Integer, Address, Crystal, Seconds, Mac, EraseOption, Selection };

/// What reads a setting. Bits, since some are read by several.
enum Use : unsigned {
    kLoad = 1,
    kErase = 2,
    kBlankCheck = 4,
    kChecksum = 8,
    kProgramRegister0 = 16,
    kProgramRegister1 = 32,
    kProgramMac = 64,
};

struct KnownSetting {
    const char* key;
    Form form;
    unsigned uses;  ///< those that fail without it
};

std::span<const KnownSetting> KnownSettings();

/// Whether the plug-in reads the text as what it says, neither refusing it nor taking it for
/// something else without a word.
bool HasForm(Form form, const std::string& text);

/// For people: "0 or 1".
const char* FormText(Form form);

}  // namespace hostcheck
