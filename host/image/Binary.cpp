// Raw binary: the bytes alone, whose address comes from elsewhere.

#include <fmt/format.h>

#include "host/base/Errors.h"
#include "host/image/Formats.h"

namespace host::image {
namespace {

// Flash and RAM of one device lie 512 MiB apart: a file that spans both is a mistake.
constexpr std::uint64_t kMaxSpanBytes = std::uint64_t{256} << 20;
constexpr char kErased = '\xFF';

std::uint64_t SpanBytes(const Image& image) {
    return image.Empty() ? 0 : image.Sections().back().End() - image.Sections().front().address;
}

}  // namespace

Image ParseBinary(const std::string& contents, const std::string& name, std::uint32_t base) {
    Image image;
    image.Add(base, {contents.begin(), contents.end()}, name);
    return image;
}

std::string FormatBinary(const Image& image) {
    const std::uint64_t span = SpanBytes(image);
    if (span > kMaxSpanBytes) {
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("raw binary: the gaps filled, the bytes from {:#x} to {:#x} "
                                  "would take {} MiB; write Intel HEX (.hex) or S-records (.srec)",
                                  image.Sections().front().address, image.Sections().back().Last(),
                                  span >> 20));
    }
    std::string contents;
    contents.reserve(span);
    for (const Section& section : image.Sections()) {
        contents.resize(section.address - image.Sections().front().address, kErased);
        contents.append(section.bytes.begin(), section.bytes.end());
    }
    return contents;
}

}  // namespace host::image
