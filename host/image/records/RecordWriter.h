// What writing Intel HEX and writing S-records have in common: an image cut into records.

#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>

#include "host/image/Image.h"

namespace host::image {

/// The data bytes of a full record, as most tools write them.
constexpr std::size_t kRecordDataBytes = 16;

/// Calls `write(address, bytes)` for each record of the image. Records end at multiples of their
/// full length: none crosses a 64 KiB border, and equal memory gives equal lines wherever the
/// section around it begins.
template <typename Write>
void ForEachRecord(const Image& image, Write write) {
    for (const Section& section : image.Sections()) {
        const Bytes bytes(section.bytes);
        for (std::size_t done = 0; done < bytes.size();) {
            const auto address = static_cast<std::uint32_t>(section.address + done);
            const std::size_t room = kRecordDataBytes - address % kRecordDataBytes;
            const std::size_t count = std::min(room, bytes.size() - done);
            write(address, bytes.subspan(done, count));
            done += count;
        }
    }
}

}  // namespace host::image
