// One image format, whatever the file holds: it is read or refused with a Failure, and what was
// read survives being written and read again in every format that can be written.

#include <algorithm>

#include "fuzz/Require.h"
#include "host/base/Errors.h"
#include "host/image/Image.h"

using namespace host::image;

namespace {

bool IsOrdered(const Image& image) {
    const auto& sections = image.Sections();
    const auto touch = [](const Section& one, const Section& next) {
        return one.bytes.empty() || next.bytes.empty() || one.End() >= next.address;
    };
    return std::ranges::adjacent_find(sections, touch) == sections.end();
}

void RequireRoundTrip(const Image& image, Format format, const ReadOptions& options) {
    Require(ParseImage(FormatImage(image, format), "written", options) == image,
            "an image that was written reads the same");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    Image image;
    try {
        image = ParseImage({data, data + size}, "fuzzed", {Format::FUZZED_FORMAT, {}});
    } catch (const host::Failure& failure) {
        Require(failure.Status() == host::ExitStatus::BadFile && *failure.what() != '\0',
                "a refusal says why");
        return 0;
    }
    Require(!image.Empty() && IsOrdered(image), "sections are in order and do not touch");
    RequireRoundTrip(image, Format::IntelHex, {});
    RequireRoundTrip(image, Format::SRecord, {});
    const Section& first = image.Sections().front();
    if (image.Sections().size() == 1) {
        RequireRoundTrip(image, Format::Binary, {Format::Binary, first.address});
    }
    return 0;
}
