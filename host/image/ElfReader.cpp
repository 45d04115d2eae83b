// ELF: every loadable segment with bytes in the file, at its physical address. What follows them
// in memory are variables, which the program clears by itself.

#include <fmt/format.h>

#include "base/Elf.h"
#include "host/base/Errors.h"
#include "host/image/Formats.h"

namespace host::image {

Image ParseElf(const std::string& contents, const std::string& name) try {
    Image image;
    for (const base::ElfSegment& segment : base::ReadElf(contents).segments)
        if (!segment.bytes.empty())
            image.Add(segment.address, {segment.bytes.begin(), segment.bytes.end()},
                      fmt::format("{}: segment {}", name, segment.number));
    return image;
} catch (const base::ElfError& error) {
    throw Failure(ExitStatus::BadFile, fmt::format("{}: {}", name, error.what()));
}

}  // namespace host::image
