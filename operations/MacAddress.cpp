// A MAC address lies in the two user registers: three bytes in each, the first in the lowest bits.

#include <array>

#include "device/FlashCorvane.h"
#include "device/RegisterMap.h"
#include "device/SettingKeys.h"
#include "plugin/Conversions.h"
#include "plugin/Trace.h"

namespace {

// Six pairs and the five characters between them, whatever these are.
constexpr std::size_t kTextLength = 17;

}  // namespace

void FlashCorvane::ReadMACAddress(const RegisterValues& values) {
    std::string text;
    for (const std::uint32_t value : values) {
        for (int shift = 0; shift < 24; shift += 8) {
            if (!text.empty()) text += '-';
            text += ToHexText(value >> shift & 0xFF);
        }
    }
    p_mHost.SetSetting(Setting::FlashMACAddrInput, text);
    p_mHost.ShowMessageText("MAC address value: " + text);
}

bool FlashCorvane::ProgramMACAddress(CommitRequests& requests) {
    std::uint32_t register0 = 0;
    std::uint32_t register1 = 0;
    if (!ParseMACAddressString(p_mHost.GetSetting(Setting::FlashMACAddrInput), register0,
                               register1)) {
        p_mHost.ShowErrorText(
            "The given MAC address is not valid. Please check it is in the following format "
            "XX-XX-XX-XX-XX-XX.");
        TRACE(Result, "FlashCorvane::UserRegisterOperation() = false");
        return false;
    }
    p_mHost.WriteWord(Register::UserRegister0, register0);
    p_mHost.WriteWord(Register::UserRegister1, register1);
    // Half an address is worth nothing: both registers are committed, or neither.
    requests.fill(ParseHex(p_mHost.GetSetting(Setting::FlashMACAddrCommit)) == 1);
    return true;
}

bool FlashCorvane::ParseMACAddressString(const std::string& text, std::uint32_t& register0,
                                         std::uint32_t& register1) {
    TRACE(Entry, "FlashCorvane::ParseMACAddressString(%s)", text.c_str());
    if (text.size() != kTextLength) {
        TRACE(Result, "FlashCorvane::ParseMACAddressString() = false");
        return false;
    }
    std::array<std::uint32_t, 6> pairs{};
    for (std::size_t k = 0; k < pairs.size(); ++k)
        pairs[k] = ParseHex(text.substr(3 * k, 2));
    // A pair can be larger than a byte: "-1" is one below zero.
    register0 = (pairs[2] * 256 + pairs[1]) * 256 + pairs[0];
    register1 = (pairs[5] * 256 + pairs[4]) * 256 + pairs[3];
    p_mHost.ShowMessageText("Writing the following value to Register0 (" + ToHexText(register0) +
                            ") and Register1 (" + ToHexText(register1) +
                            ") translated from the given MAC address");
    TRACE(Result,
          "FlashCorvane::ParseMACAddressString() = true, register0 = 0x%08X, register1 = 0x%08X",
          register0, register1);
    return true;
}
