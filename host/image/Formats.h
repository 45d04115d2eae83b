// The readers and writers of the single file formats, behind ParseImage and FormatImage.

#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "host/image/Image.h"

namespace host::image {

/// Each reads the contents of a file; `name` stands for the file in error texts. What is wrong
/// with the contents is a Failure (BadFile).
Image ParseElf(const std::string& contents, const std::string& name);
Image ParseIntelHex(const std::string& contents, const std::string& name);
Image ParseSRecord(const std::string& contents, const std::string& name);
Image ParseBinary(const std::string& contents, const std::string& name, std::uint32_t base);

/// Where a program begins, as the contents of a valid file tell it; raw binary never does.
std::optional<std::uint32_t> EntryOf(const std::string& contents, Format format);

/// Each makes the contents of a file.
std::string FormatIntelHex(const Image& image);
std::string FormatSRecord(const Image& image);
std::string FormatBinary(const Image& image);

}  // namespace host::image
