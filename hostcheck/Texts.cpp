#include "hostcheck/Texts.h"

#include <algorithm>

namespace hostcheck {

namespace {

constexpr std::size_t kShownCharactersMax = 160;
constexpr std::size_t kShownBytesMax = 16;
constexpr char kLowerDigits[] = "0123456789abcdef";
constexpr char kUpperDigits[] = "0123456789ABCDEF";

std::string HexByte(std::uint8_t byte) {
    return {kLowerDigits[byte / 16], kLowerDigits[byte % 16]};
}

}  // namespace

std::string Quoted(const std::string& text) {
    std::string quoted = "\"";
    for (const char character : text.substr(0, kShownCharactersMax)) {
        const auto byte = static_cast<std::uint8_t>(character);
        if (byte >= ' ' && byte <= '~')
            quoted += character;
        else
            quoted += "\\x" + HexByte(byte);
    }
    return quoted + (text.size() > kShownCharactersMax ? "...\"" : "\"");
}

std::string HexWord(std::uint32_t value) {
    std::string text = "0x";
    for (int shift = 28; shift >= 0; shift -= 4)
        text += kUpperDigits[value >> shift & 0xF];
    return text;
}

std::string HexBytes(const Bytes& bytes) {
    std::string text;
    const std::size_t shown = std::min(bytes.size(), kShownBytesMax);
    for (std::size_t i = 0; i < shown; ++i)
        text += (i == 0 ? "" : " ") + HexByte(bytes[i]);
    return text + (bytes.size() > shown ? " ..." : "");
}

}  // namespace hostcheck
