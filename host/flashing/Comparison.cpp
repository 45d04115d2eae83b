// Reading flash back piece by piece, and saying what differs.

#include "host/flashing/Comparison.h"

#include <fmt/format.h>

#include <algorithm>

#include "host/driver/FlashDevice.h"

namespace host {

namespace {

/// So much is read before it is compared; an image can be as large as the flash.
constexpr std::size_t kPieceBytes = std::size_t{1024} * 1024;

}  // namespace

void Compare(std::optional<Difference>& difference, std::uint32_t address,
             std::span<const std::uint8_t> expected, std::span<const std::uint8_t> actual) {
    for (std::size_t i = 0; i < expected.size(); ++i) {
        if (expected[i] == actual[i]) continue;
        if (!difference)
            difference = {address + static_cast<std::uint32_t>(i), expected[i], actual[i], 0,
                          false};
        ++difference->count;
        if ((expected[i] & ~actual[i]) != 0) difference->notErased = true;
    }
}

std::optional<Difference> CompareWithFlash(FlashDevice& device, const image::Image& image) {
    std::optional<Difference> difference;
    device.Halt();
    device.Meter().Begin(Phase::Verify);
    for (const image::Section& section : image.Sections()) {
        std::span<const std::uint8_t> rest = section.bytes;
        for (std::uint32_t address = section.address; !rest.empty();) {
            const auto piece = rest.first(std::min(kPieceBytes, rest.size()));
            const auto last = address + static_cast<std::uint32_t>(piece.size() - 1);
            Compare(difference, address, piece, device.ReadFlash({address, last}));
            rest = rest.subspan(piece.size());
            address = last + 1;
        }
    }
    device.Meter().End();
    return difference;
}

std::string Describe(const Difference& difference) {
    return fmt::format(
        "the flash differs from the image: first at {:#x}, expected {:#04x}, actual {:#04x}; {} "
        "differ{}; {}",
        difference.address, difference.expected, difference.actual,
        difference.count == 1 ? "1 byte" : fmt::format("{} bytes", difference.count),
        difference.count == 1 ? "s" : "",
        difference.notErased
            ? "some bits were not erased: program with --erase necessary, or erase the range "
              "first; a cell that stays so is damaged"
            : "no bit needs an erase: the bytes were not programmed, or not from this image");
}

Json ToJson(const Difference& difference) {
    return {{"address", difference.address},
            {"expected", difference.expected},
            {"actual", difference.actual},
            {"bytes", difference.count},
            {"notErased", difference.notErased}};
}

}  // namespace host
