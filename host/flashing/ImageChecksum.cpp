// zlib's CRC-32 is the plug-in's, too.

#include "host/flashing/ImageChecksum.h"

#include <zlib.h>

#include <algorithm>
#include <vector>

namespace host {

std::uint32_t ImageChecksum(const image::Image& image, const base::AddressRange& range) {
    uLong crc = crc32(0, nullptr, 0);
    std::uint64_t next = range.first;
    const std::vector<std::uint8_t> erased(0x10000, 0xFF);
    const auto fill = [&](std::uint64_t end) {
        while (next < end) {
            const std::uint64_t count = std::min<std::uint64_t>(erased.size(), end - next);
            crc = crc32(crc, erased.data(), static_cast<uInt>(count));
            next += count;
        }
    };
    for (const image::Section& section : image.Sections()) {
        const std::uint64_t first = std::max(section.address, range.first);
        const std::uint64_t end = std::uint64_t{std::min(section.Last(), range.last)} + 1;
        if (first >= end) continue;
        fill(first);
        crc = crc32(crc, section.bytes.data() + (first - section.address),
                    static_cast<uInt>(end - first));
        next = end;
    }
    fill(std::uint64_t{range.last} + 1);
    return static_cast<std::uint32_t>(crc);
}

std::string ChecksumText(const std::string& digits) {
    return "0x" + std::string(8 - std::min<std::size_t>(8, digits.size()), '0') + digits;
}

}  // namespace host
