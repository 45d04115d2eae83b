// What the texts of settings look like. The conversions are the plug-in's own; where they never
// fail, a text is good when nothing of it is lost on them.

#include <algorithm>
#include <exception>
#include <string_view>

#include "device/SettingKeys.h"
#include "hostcheck/KnownSettings.h"
#include "plugin/Conversions.h"

namespace hostcheck {

namespace {

constexpr std::string_view kHexDigits = "0123456789abcdefABCDEF";
constexpr std::string_view kBlanks = " \t\n\v\f\r";

template <typename Conversion>
bool Converts(Conversion conversion, const std::string& text) {
    try {
        conversion(text);
        return true;
    } catch (const std::exception&) {
        return false;
    }
}

/// A text of blanks is 0 to the plug-in, and meant so: nothing is in the field.
bool IsHex(std::string_view text) {
    text.remove_prefix(std::min(text.find_first_not_of(kBlanks), text.size()));
    text = text.substr(0, text.find_last_not_of(kBlanks) + 1);
    if (text.empty()) return true;
    if (text.starts_with('+') || text.starts_with('-')) text.remove_prefix(1);
    if (text.starts_with("0x") || text.starts_with("0X")) text.remove_prefix(2);
    if (text.empty() || text.find_first_not_of(kHexDigits) != std::string_view::npos) return false;
    return text.size() - std::min(text.find_first_not_of('0'), text.size()) <= 8;
}

/// Only a text of this length is taken for an address, whatever stands in it.
bool IsMac(const std::string& text) {
    if (text.size() != 17) return true;
    for (std::size_t i = 0; i < text.size(); i += 3)
        if (text.substr(i, 2).find_first_not_of(kHexDigits) != std::string::npos) return false;
    return true;
}

}  // namespace

bool HasForm(Form form, const std::string& text) {
    switch (form) {
        case Form::Switch:
            return Converts(ParseBoolean, text);
        case Form::Integer:
            return Converts(ParseInteger, text);
        case Form::Seconds:
            return Converts(ParseDecimal, text) && ParseDecimal(text) >= 1;
        case Form::Address:
            return IsHex(text);
        case Form::Crystal:
            return IsHex(text) && ParseHex(text) >= 1;
        case Form::Mac:
            return IsMac(text);
        case Form::EraseOption:
            return text == Choice::NecessaryPagesOnly || text == Choice::DoNotErase ||
                   text == Choice::UseEraseOptions;
        case Form::Selection:
            return text == Choice::EntireFlash || text == Choice::ByAddressRange;
    }
    return false;
}

const char* FormText(Form form) {
    switch (form) {
        case Form::Switch:
            return "0 or 1";
        case Form::Integer:
            return "a whole decimal number";
        case Form::Seconds:
            return "a whole decimal number of seconds, at least 1";
        case Form::Address:
            return "a hexadecimal number up to ffffffff";
        case Form::Crystal:
            return "a hexadecimal number of MHz, at least 1";
        case Form::Mac:
            return "six pairs of hexadecimal digits, as in 02-1b-c3-04-05-06";
        case Form::EraseOption:
            return "\"Necessary Pages Only\", \"Do Not Erase Flash Memory\" or "
                   "\"Use the Erase Options Specified Below\"";
        case Form::Selection:
            return R"("Entire Flash" or "By Address Range")";
    }
    return "";
}

}  // namespace hostcheck
