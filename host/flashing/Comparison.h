// Comparing flash with what it should hold.

#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "host/base/Json.h"
#include "host/base/Text.h"
#include "host/driver/FlashReader.h"
#include "host/image/Image.h"
#include "host/output/Reporter.h"
#include "host/output/WorkMeter.h"

namespace host {

struct LoadedImages;

/// Bytes that differ, near enough to each other to be told as one range.
struct DifferentRange {
    base::AddressRange range;
    std::uint8_t expected = 0;  ///< of the first byte, which differs
    std::uint8_t actual = 0;

    bool operator==(const DifferentRange&) const = default;
};

struct Differences {
    static constexpr std::size_t kRangesShown = 8;
    std::uint64_t byteCount = 0;  ///< that differ
    std::uint64_t rangeCount = 0;
    std::vector<DifferentRange> ranges = {};  ///< the first of them
    std::uint32_t lastAddress = 0;            ///< of the last byte that differs

    /// The first byte of which a bit that should be 1 is 0: only an erase can mend that.
    std::optional<std::uint32_t> notErased = {};

    /// Some of the bytes weren't read, for their CRC-32 was right.
    bool byChecksum = false;

    std::size_t rangesShown = kRangesShown;  ///< no more of them are kept

    bool Empty() const { return byteCount == 0; }
    bool operator==(const Differences&) const = default;
};

/// "crc-32" or "bytes", for JSON.
const char* ComparedBy(const Differences& differences);

/// Adds what differs between two runs of bytes at an address to what was found so far, below it.
void Compare(Differences& differences, std::uint32_t address,
             std::span<const std::uint8_t> expected, std::span<const std::uint8_t> actual);

/// Compares all that the image covers: by its CRC-32 where the target can tell that, and the bytes
/// where it can't, or where it is another one. The target is halted first.
Differences CompareWithFlash(FlashReader& reader, WorkMeter& meter, const image::Image& image,
                             std::size_t rangesShown = Differences::kRangesShown);

/// The same of some ranges with what an erase leaves.
Differences CompareWithErased(FlashReader& reader, WorkMeter& meter,
                              const std::vector<base::AddressRange>& ranges);

/// Makes the outcome the failure (ContentsDiffer) of a flash that should hold the images, with a
/// line for each of the first ranges that names the file; `advice` ends the closing line.
void FailAsDifferent(Outcome& outcome, const Differences& differences, const LoadedImages& images,
                     const std::string& advice);

/// The same of a load that would leave such a flash.
void FailAsForecast(Outcome& outcome, const Differences& differences, const LoadedImages& images,
                    const std::string& advice);

/// The same of a flash that should be erased.
void FailAsNotErased(Outcome& outcome, const Differences& differences);

}  // namespace host
