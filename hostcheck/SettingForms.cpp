// The conversions are the plug-in's own.

#include "hostcheck/SettingForms.h"

#include <algorithm>
#include <cstddef>
#include <exception>

#include "device/SettingKeys.h"
#include "plugin/Conversions.h"

namespace hostcheck {

namespace {

constexpr KnownSetting kSettings[] = {
    {Setting::FlashProgramOption, Form::EraseOption, true},
    {Setting::FlashProgramBlankCheckOption, Form::Switch, true},
    {Setting::FlashProgramCRCOption, Form::Switch, true},
    {Setting::FlashResetSetting, Form::Switch, true},
    {Setting::FlashTimeoutValue, Form::Seconds, true},
    {Setting::FlashVerboseMode, Form::Integer, true},
    {Setting::FlashCrystalFreq, Form::Hex},
    {Setting::FlashEraseType, Form::Selection},
    {Setting::FlashEraseStartAddr, Form::Hex},
    {Setting::FlashEraseEndAddr, Form::Hex},
    {Setting::FlashBlankCheckSelection, Form::Selection},
    {Setting::FlashBlankCheckStartAddr, Form::Hex},
    {Setting::FlashBlankCheckEndAddr, Form::Hex},
    {Setting::FlashChecksumSelection, Form::Selection},
    {Setting::FlashChecksumStartAddr, Form::Hex},
    {Setting::FlashChecksumEndAddr, Form::Hex},
    {"FlashUserRegister0Input", Form::Hex},
    {"FlashUserRegister0Commit", Form::Hex},
    {"FlashUserRegister1Input", Form::Hex},
    {"FlashUserRegister1Commit", Form::Hex},
    {Setting::FlashMACAddrInput, Form::Mac},
    {Setting::FlashMACAddrCommit, Form::Hex},
};

constexpr char kHexDigits[] = "0123456789abcdefABCDEF";

template <typename Conversion>
bool Converts(Conversion conversion, const std::string& text) {
    try {
        conversion(text);
        return true;
    } catch (const std::exception&) {
        return false;
    }
}

bool IsHex(const std::string& text) {
    const bool prefixed = text.starts_with("0x") || text.starts_with("0X");
    const std::string digits = text.substr(prefixed ? 2 : 0);
    return !digits.empty() && digits.find_first_not_of(kHexDigits) == std::string::npos &&
           digits.size() - std::min(digits.find_first_not_of('0'), digits.size()) <= 8;
}

bool IsMac(const std::string& text) {
    if (text.size() != 17) return false;
    for (std::size_t i = 0; i < text.size(); i += 3)
        if (text.substr(i, 2).find_first_not_of(kHexDigits) != std::string::npos) return false;
    return true;
}

}  // namespace

std::span<const KnownSetting> KnownSettings() {
    return kSettings;
}

bool HasForm(Form form, const std::string& text) {
    switch (form) {
        case Form::Switch:
            return Converts(ParseBoolean, text);
        case Form::Integer:
            return Converts(ParseInteger, text);
        case Form::Seconds:
            return Converts(ParseDecimal, text) && ParseDecimal(text) >= 1;
        case Form::Hex:
            return IsHex(text);
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
        case Form::Hex:
            return "a hexadecimal number up to ffffffff";
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
