// A hex dump, for people: sixteen bytes a line, and '*' for lines that repeat the one above.

#include <fmt/format.h>

#include <algorithm>

#include "base/Hex.h"
#include "host/image/Image.h"

namespace host::image {
namespace {

constexpr std::size_t kLineBytes = 16;

std::string Line(std::uint64_t address, Bytes bytes) {
    std::string hex;
    std::string text;
    for (std::size_t i = 0; i < bytes.size(); ++i) {
        hex += fmt::format("{}{:02x} ", i == kLineBytes / 2 ? " " : "", bytes[i]);
        text += bytes[i] >= ' ' && bytes[i] <= '~' ? static_cast<char>(bytes[i]) : '.';
    }
    return fmt::format("{:08x}  {:<49} |{}|\n", address, hex, text);
}

}  // namespace

std::string FormatDump(const Image& image) {
    std::string dump;
    for (const Section& section : image.Sections()) {
        Bytes rest(section.bytes);
        Bytes above;
        bool repeats = false;
        while (!rest.empty()) {
            const Bytes line = rest.first(std::min(kLineBytes, rest.size()));
            rest = rest.subspan(line.size());
            const bool same = std::ranges::equal(line, above) && !rest.empty();
            if (!same) dump += Line(section.End() - rest.size() - line.size(), line);
            if (same && !repeats) dump += "*\n";
            repeats = same;
            above = line;
        }
    }
    return dump;
}

}  // namespace host::image
