// Reading flash back piece by piece, and saying what differs.

#include "host/flashing/Comparison.h"

#include <fmt/format.h>

#include <algorithm>

#include "host/base/Text.h"
#include "host/flashing/ImageSet.h"

namespace host {

namespace {

/// So much is read before it is compared; an image can be as large as the flash.
constexpr std::size_t kPieceBytes = std::size_t{1024} * 1024;

/// Equal bytes that don't end a range: some are equal by chance.
constexpr std::uint32_t kJoinedGapBytesMax = 15;

void Add(Differences& differences, std::uint32_t address, std::uint8_t expected,
         std::uint8_t actual) {
    const bool joins =
        differences.rangeCount != 0 && address - differences.lastAddress <= kJoinedGapBytesMax + 1;
    if (!joins && ++differences.rangeCount <= differences.rangesShown)
        differences.ranges.push_back({{address, address}, expected, actual});
    if (differences.rangeCount <= differences.rangesShown)
        differences.ranges.back().range.last = address;
    ++differences.byteCount;
    differences.lastAddress = address;
    if ((expected & ~actual) != 0 && !differences.notErased) differences.notErased = address;
}

/// Calls `compare` for each piece of a range.
template <typename Action>
void ForEachPiece(const base::AddressRange& range, const Action& compare) {
    std::uint64_t rest = range.Size();
    for (std::uint32_t address = range.first; rest > 0;) {
        const auto size = static_cast<std::uint32_t>(std::min<std::uint64_t>(kPieceBytes, rest));
        compare(base::AddressRange{address, address + (size - 1)});
        rest -= size;
        address += size;
    }
}

template <typename Action>
Differences Verify(FlashReader& reader, WorkMeter& meter, const Action& compare) {
    Differences differences;
    reader.Halt();
    meter.Begin(Phase::Verify);
    compare(differences);
    meter.End();
    return differences;
}

std::string Extent(const Differences& differences) {
    return fmt::format("{} in {}", CountText(differences.byteCount, "byte"),
                       CountText(differences.rangeCount, "range"));
}

Json ToJson(const Differences& differences, const LoadedImages* images) {
    Json ranges = Json::array();
    for (const auto& [range, expected, actual] : differences.ranges) {
        ranges.push_back({{"address", range.first},
                          {"bytes", range.Size()},
                          {"expected", expected},
                          {"actual", actual}});
        if (images != nullptr) ranges.back()["file"] = images->FileOf(range.first);
    }
    const DifferentRange& first = differences.ranges.front();
    return {{"address", first.range.first},
            {"expected", first.expected},
            {"actual", first.actual},
            {"bytes", differences.byteCount},
            {"ranges", ranges},
            {"rangeCount", differences.rangeCount},
            {"notErased", differences.notErased.has_value()}};
}

void Fail(Outcome& outcome, const Differences& differences, const LoadedImages* images,
          std::string error) {
    outcome.status = ExitStatus::ContentsDiffer;
    outcome.error = std::move(error);
    outcome.result["difference"] = ToJson(differences, images);
    // The closing line of an erase has the first byte already.
    if (images == nullptr && differences.rangeCount == 1) return;
    for (const auto& [range, expected, actual] : differences.ranges)
        outcome.details.push_back(fmt::format(
            "  {:<23} {}first expected {:#04x}, actual {:#04x}", RangeText(range),
            images == nullptr ? "" : images->FileOf(range.first) + ": ", expected, actual));
    if (const auto more = differences.rangeCount - differences.ranges.size(); more != 0)
        outcome.details.push_back("  and " + CountText(more, "more range"));
}

}  // namespace

const char* ComparedBy(const Differences& differences) {
    return differences.byChecksum ? "crc-32" : "bytes";
}

void Compare(Differences& differences, std::uint32_t address,
             std::span<const std::uint8_t> expected, std::span<const std::uint8_t> actual) {
    for (std::size_t i = 0; i < expected.size(); ++i)
        if (expected[i] != actual[i])
            Add(differences, address + static_cast<std::uint32_t>(i), expected[i], actual[i]);
}

Differences CompareWithFlash(FlashReader& reader, WorkMeter& meter, const image::Image& image,
                             std::size_t rangesShown) {
    return Verify(reader, meter, [&](Differences& differences) {
        differences.rangesShown = rangesShown;
        for (const image::Section& section : image.Sections())
            ForEachPiece({section.address, section.Last()}, [&](const base::AddressRange& piece) {
                const std::span<const std::uint8_t> expected =
                    std::span(section.bytes).subspan(piece.first - section.address, piece.Size());
                if (reader.HoldsByChecksum(piece.first, expected).value_or(false))
                    differences.byChecksum = true;
                else
                    Compare(differences, piece.first, expected, reader.ReadFlash(piece));
            });
    });
}

Differences CompareWithErased(FlashReader& reader, WorkMeter& meter,
                              const std::vector<base::AddressRange>& ranges) {
    const std::vector<std::uint8_t> erased(kPieceBytes, 0xFF);
    const auto compare = [&](Differences& differences) {
        for (const base::AddressRange& range : ranges)
            ForEachPiece(range, [&](const base::AddressRange& piece) {
                Compare(differences, piece.first, std::span(erased).first(piece.Size()),
                        reader.ReadFlash(piece));
            });
    };
    return Verify(reader, meter, compare);
}

void FailAsDifferent(Outcome& outcome, const Differences& differences, const LoadedImages& images,
                     const std::string& advice) {
    Fail(outcome, differences, &images,
         fmt::format("the flash differs from {}: {}{}{}", images.Name(), Extent(differences),
                     advice.empty() ? "" : "; ", advice));
}

void FailAsForecast(Outcome& outcome, const Differences& differences, const LoadedImages& images,
                    const std::string& advice) {
    Fail(outcome, differences, &images,
         fmt::format("this load would fail: the flash would differ from {}: {}; {}", images.Name(),
                     Extent(differences), advice));
}

void FailAsNotErased(Outcome& outcome, const Differences& differences) {
    const DifferentRange& first = differences.ranges.front();
    Fail(outcome, differences, nullptr,
         fmt::format("the flash isn't blank although the device reported the erase done: {:#x} "
                     "holds {:#04x}, not 0xff; {} not blank; the cells are worn out or protected",
                     first.range.first, first.actual, Extent(differences)));
    outcome.result["blank"] = false;
}

}  // namespace host
