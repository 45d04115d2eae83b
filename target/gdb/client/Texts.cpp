// Shortening what servers say.

#include "target/gdb/client/Texts.h"

#include <algorithm>

namespace target::gdb {

std::string LastLines(const std::string& output) {
    constexpr std::size_t kLines = 3;
    constexpr std::size_t kBytesMax = 300;
    std::string text = output.substr(output.size() - std::min(output.size(), kBytesMax));
    while (!text.empty() && (text.back() == '\n' || text.back() == '\r'))
        text.pop_back();
    std::size_t lines = 0;
    for (std::size_t i = text.size(); i-- > 0;) {
        if (text[i] == '\n' && ++lines == kLines) {
            text.erase(0, i + 1);
            break;
        }
    }
    std::string shown;
    for (const char byte : text) {
        if (byte == '\n')
            shown += " / ";
        else if (byte >= ' ' && byte <= '~')
            shown += byte;
    }
    return shown.empty() ? "" : ": " + shown;
}

}  // namespace target::gdb
