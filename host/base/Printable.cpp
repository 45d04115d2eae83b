// Walking over UTF-8.

#include "host/base/Printable.h"

#include <fmt/format.h>

#include <cstddef>

namespace host {

namespace {

unsigned ByteAt(std::string_view text, std::size_t at) {
    return at < text.size() ? static_cast<unsigned char>(text[at]) : 0;
}

/// How many bytes the character there has; 0 when it is none. Long forms and surrogates do no harm.
std::size_t CharacterBytes(std::string_view text, std::size_t at) {
    const unsigned first = ByteAt(text, at);
    const std::size_t size = first < 0x80                    ? 1
                             : first >= 0xC2 && first < 0xE0 ? 2
                             : first >= 0xE0 && first < 0xF0 ? 3
                             : first >= 0xF0 && first < 0xF5 ? 4
                                                             : 0;
    for (std::size_t i = 1; i < size; ++i)
        if ((ByteAt(text, at + i) & 0xC0) != 0x80) return 0;
    return size;
}

/// U+0080 to U+009F: a terminal takes some of them for the beginning of a command.
bool IsC1(std::string_view text, std::size_t at) {
    return ByteAt(text, at) == 0xC2 && (ByteAt(text, at + 1) & 0xE0) == 0x80;
}

bool IsControl(unsigned byte) {
    return byte < 0x20 || byte == 0x7F;
}

}  // namespace

std::string Printable(std::string_view text, Breaks breaks) {
    std::string shown;
    shown.reserve(text.size());
    for (std::size_t at = 0; at < text.size();) {
        const unsigned byte = ByteAt(text, at);
        const std::size_t size = CharacterBytes(text, at);
        if (IsC1(text, at))
            shown += fmt::format("\\u{:04x}", ByteAt(text, at + 1));
        else if (byte == '\n')
            shown += breaks == Breaks::Keep ? "\n" : "\\n";
        else if (size == 0 || (IsControl(byte) && byte != '\t'))
            shown += fmt::format("\\x{:02x}", byte);
        else
            shown += text.substr(at, size);
        at += size == 0 ? 1 : size;
    }
    return shown;
}

std::string PrintableJson(std::string_view json) {
    std::string shown;
    shown.reserve(json.size());
    for (std::size_t at = 0; at < json.size(); ++at) {
        if (ByteAt(json, at) == 0x7F)
            shown += "\\u007f";
        else if (IsC1(json, at))
            shown += fmt::format("\\u{:04x}", ByteAt(json, ++at));
        else
            shown += json[at];
    }
    return shown;
}

}  // namespace host
