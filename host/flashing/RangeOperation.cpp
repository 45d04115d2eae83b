// The operations that take a range, and how each widens it.

#include "host/flashing/RangeOperation.h"

#include <fmt/format.h>

#include "host/driver/FlashDevice.h"
#include "host/facts/Operations.h"
#include "host/flashing/Comparison.h"
#include "host/flashing/DeviceGeometry.h"
#include "host/output/Summary.h"

namespace host {

namespace {

/// What an operation works on, and the unit that it widens its range to (0: a sector).
struct RangeOperation {
    const char* name;
    Phase phase;
    const RangeKeys& keys;
    std::uint32_t unitBytes;
};

const RangeOperation kRangeOperations[] = {
    {plugin::kErase, Phase::Erase, kEraseKeys, 0},
    {plugin::kBlankCheck, Phase::BlankCheck, kBlankCheckKeys, 4},
    {plugin::kCalculateChecksum, Phase::Checksum, kChecksumKeys, 1},
};

/// What the operation will cover; nothing when the plug-in will refuse it or do nothing.
std::optional<base::AddressRange> CoveredRange(FlashDevice& device,
                                               const RangeOperation& operation) {
    const DeviceInfo& info = device.Info();
    if (!info.hasFlash) return std::nullopt;
    const base::AddressRange range =
        SelectedRange(device.Settings(), operation.keys).value_or(info.Flash());
    if (range.first > range.last || range.last >= info.flashBytes) return std::nullopt;
    return operation.unitBytes == 0 ? SectorsCovering(range, GeometryOf(device.Info()))
                                    : Widened(range, operation.unitBytes);
}

/// Returns what is to be read back afterwards.
std::optional<base::AddressRange> Announce(FlashDevice& device, const RangeOperation& operation,
                                           bool verifyErase) {
    const auto covered = CoveredRange(device, operation);
    if (!covered) return std::nullopt;
    device.Meter().Expect(operation.phase, covered->Size());
    if (operation.phase != Phase::Erase) return std::nullopt;
    device.Output().Say(
        Verbosity::Normal,
        fmt::format("Erase covers {}: {}", RangeText(*covered),
                    CountText(SectorCount(*covered, GeometryOf(device.Info())), "sector")));
    if (!verifyErase) return std::nullopt;
    device.Meter().Expect(Phase::Verify, covered->Size());
    return covered;
}

}  // namespace

base::AddressRange ChooseRange(FlashDevice& device, const RangeKeys& keys,
                               const std::optional<std::string>& text) {
    const base::AddressRange range = device.RangeInFlash(text);
    SelectRange(device.Settings(), keys, text ? std::optional(range) : std::nullopt);
    return range;
}

Outcome RunOperation(FlashDevice& device, const std::string& name, Verbosity level,
                     bool verifyErase) {
    std::optional<base::AddressRange> erased;
    for (const RangeOperation& operation : kRangeOperations)
        if (name == operation.name) erased = Announce(device, operation, verifyErase);
    device.Perform(name, level);
    Outcome outcome{.result = {{"operation", name}}};
    if (erased) {
        outcome.result["blank"] = true;
        if (const Differences differences = CompareWithErased(device, device.Meter(), *erased);
            !differences.Empty())
            FailAsNotErased(outcome, differences);
    }
    outcome.result["phases"] = PhasesJson(device.Meter().Phases());
    ShowSummary(device.Output(), device.Meter().Phases());
    return outcome;
}

}  // namespace host
