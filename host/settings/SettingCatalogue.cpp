// The defaults let a program load work with no settings file at all, and
// never erase more than the image needs.

#include "host/settings/SettingCatalogue.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <charconv>
#include <limits>
#include <stdexcept>
#include <system_error>

#include "base/Hex.h"
#include "host/base/MacAddress.h"
#include "host/base/Suggestion.h"
#include "host/base/Text.h"
#include "host/facts/SettingKeys.h"

namespace host {

namespace {

using Form = SettingForm;

const std::vector<const char*> kSelections{keys::kEntireFlash, keys::kByAddressRange};

const SettingInfo kCatalogue[] = {
    {keys::kProgramOption,
     Form::Choice,
     keys::kNecessaryPages,
     "what a program load erases first: the sectors of each section, nothing, or once what "
     "FlashEraseType says",
     {keys::kNecessaryPages, keys::kNoErase, keys::kEraseOptions}},
    {keys::kProgramBlankCheck, Form::Switch, "0", "blank-check each section before programming it"},
    {keys::kProgramCrc, Form::Switch, "0",
     "calculate the CRC-32 of the whole flash at the end of a load"},
    {keys::kEraseType, Form::Choice, keys::kByAddressRange, "what an erase covers", kSelections},
    {keys::kEraseStart, Form::Hex, "0",
     "first address of a range erase; every sector it touches is erased whole"},
    {keys::kEraseEnd, Form::Hex, "0", "last address of a range erase"},
    {keys::kBlankCheckSelection, Form::Choice, keys::kEntireFlash, "what a blank check covers",
     kSelections},
    {keys::kBlankCheckStart, Form::Hex, "0",
     "first address of a range blank check, widened to whole words"},
    {keys::kBlankCheckEnd, Form::Hex, "0", "last address of a range blank check"},
    {keys::kChecksumSelection, Form::Choice, keys::kEntireFlash, "what a checksum covers",
     kSelections},
    {keys::kChecksumStart, Form::Hex, "0", "first address of a range checksum"},
    {keys::kChecksumEnd, Form::Hex, "0", "last address of a range checksum"},
    {keys::kMacInput, Form::Mac, "ff-ff-ff-ff-ff-ff",
     "MAC address to program, or the one read back"},
    {keys::kMacCommit, Form::Hex, "0", "1: commit both user registers with the MAC address"},
    {keys::kRegisterInputs[0], Form::Hex, "ffffffff",
     "value to program into user register 0, or the one read back"},
    {keys::kRegisterCommits[0], Form::Hex, "0", "1: commit user register 0 when it is programmed"},
    {keys::kRegisterInputs[1], Form::Hex, "ffffffff",
     "value to program into user register 1, or the one read back"},
    {keys::kRegisterCommits[1], Form::Hex, "0", "1: commit user register 1 when it is programmed"},
    {keys::kCrystalFreq, Form::NonzeroHex, "8",
     "crystal frequency in MHz, in hexadecimal: 10 is 16 MHz; for Ravik, Tolva and Mesk"},
    {keys::kTimeout, Form::Seconds, "30",
     "longest wait for the flash loader in one section, in seconds; corvane-flash itself waits "
     "longer for a large image"},
    {keys::kReset, Form::Switch, "1",
     "reset the target when a load or an erase begins and when a load ends"},
    {keys::kVerbose, Form::Integer, "0", "anything but 0: messages about the ranges in work"},
    {keys::kFlashSize, Form::Published, "", "flash size of the device"},
    {keys::kRamSize, Form::Published, "", "RAM size of the device"},
    {keys::kSectorSize, Form::Published, "", "size of the device's erase sectors"},
    {keys::kFamily, Form::Published, "", "class of the device"},
    {keys::kChecksumValue, Form::Published, "--", "the last CRC-32"},
};

/// A whole number as people write it, whose every reader agrees on it.
bool IsDecimal(const std::string& text, std::int32_t least) {
    std::int32_t value = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    return error == std::errc() && end == text.data() + text.size() && value >= least;
}

bool Accepts(const SettingInfo& info, const std::string& text) {
    switch (info.form) {
        case Form::Switch:
            return text == "0" || text == "1";
        case Form::Integer:
            return IsDecimal(text, std::numeric_limits<std::int32_t>::min());
        case Form::Seconds:
            return IsDecimal(text, 1);
        case Form::Hex:
            return base::ParseHex32(text).has_value();
        case Form::NonzeroHex:
            return base::ParseHex32(text).value_or(0) != 0;
        case Form::Mac:
            return ParseMacAddress(text).has_value();
        case Form::Choice:
            return std::find(info.choices.begin(), info.choices.end(), text) != info.choices.end();
        case Form::Published:
            break;
    }
    return false;
}

}  // namespace

std::span<const SettingInfo> SettingCatalogue() {
    return kCatalogue;
}

const SettingInfo* FindSetting(std::string_view key) {
    const auto found =
        std::find_if(std::begin(kCatalogue), std::end(kCatalogue),
                     [&](const SettingInfo& info) { return EqualButForCase(key, info.key); });
    return found == std::end(kCatalogue) ? nullptr : found;
}

bool IsOfOneBoard(const std::string& key) {
    const auto& inputs = keys::kRegisterInputs;
    return key == keys::kMacInput ||
           std::find(std::begin(inputs), std::end(inputs), key) != std::end(inputs);
}

std::string UnknownSetting(std::string_view key) {
    std::vector<std::string> keys;
    for (const SettingInfo& info : kCatalogue)
        keys.emplace_back(info.key);
    return fmt::format("unknown setting '{}'{}; 'corvane-flash settings' lists all keys", key,
                       Suggestion(std::string(key), keys));
}

std::string AcceptedTexts(const SettingInfo& info) {
    switch (info.form) {
        case Form::Switch:
            return "0 or 1";
        case Form::Integer:
            return "a whole decimal number";
        case Form::Seconds:
            return "a whole decimal number of seconds, at least 1";
        case Form::Hex:
            return "a hexadecimal number up to ffffffff";
        case Form::NonzeroHex:
            return "a hexadecimal number from 1 to ffffffff";
        case Form::Mac:
            return "six hexadecimal bytes, as in 02-1b-c3-04-05-06";
        case Form::Choice:
            return fmt::format("\"{}\"", fmt::join(info.choices, "\", \""));
        case Form::Published:
            break;
    }
    return "nothing: only the plug-in writes it";
}

std::string CheckedText(const SettingInfo& info, const std::string& text) {
    if (!Accepts(info, text))
        throw std::invalid_argument(
            fmt::format("{} can't be '{}'; it takes {}", info.key, text, AcceptedTexts(info)));
    return info.form == Form::Mac ? ParseMacAddress(text)->Text() : text;
}

}  // namespace host
