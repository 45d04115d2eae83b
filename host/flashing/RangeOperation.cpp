// The operations that take a range, and how each widens it.

#include "host/flashing/RangeOperation.h"

#include <fmt/format.h>

#include "base/AddressSet.h"
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

const RangeOperation* FindRangeOperation(const std::string& name) {
    for (const RangeOperation& operation : kRangeOperations)
        if (name == operation.name) return &operation;
    return nullptr;
}

Outcome Finish(FlashDevice& device, const std::string& name,
               const std::vector<base::AddressRange>& erased) {
    Outcome outcome{.result = {{"operation", name}}};
    if (!erased.empty()) {
        outcome.result["blank"] = true;
        if (const Differences differences = CompareWithErased(device, device.Meter(), erased);
            !differences.Empty())
            FailAsNotErased(outcome, differences);
    }
    outcome.result["phases"] = PhasesJson(device.Meter().Phases());
    ShowSummary(device.Output(), device.Meter().Phases());
    return outcome;
}

void Select(FlashDevice& device, const RangeOperation& operation, const ChosenRanges& chosen,
            const base::AddressRange& range) {
    SelectRange(device.Settings(), operation.keys,
                chosen.isWholeFlash ? std::nullopt : std::optional(range));
}

}  // namespace

ChosenRanges ChooseRanges(FlashDevice& device, const std::vector<std::string>& texts) {
    device.RequireFlash();
    if (texts.empty()) return {{device.Info().Flash()}, true};
    ChosenRanges chosen;
    for (const std::string& text : texts)
        chosen.ranges.push_back(device.RangeInFlash(text));
    return chosen;
}

ChosenRanges ChooseJoinedRanges(FlashDevice& device, const std::vector<std::string>& texts) {
    ChosenRanges chosen = ChooseRanges(device, texts);
    base::AddressSet joined;
    for (const base::AddressRange& range : chosen.ranges)
        joined.Add(range);
    chosen.ranges = joined.Ranges();
    return chosen;
}

Outcome RunOperation(FlashDevice& device, const std::string& name, Verbosity level) {
    std::vector<base::AddressRange> erased;
    if (const RangeOperation* operation = FindRangeOperation(name))
        if (const auto range = Announce(device, *operation, true)) erased.push_back(*range);
    device.Perform(name, level);
    return Finish(device, name, erased);
}

Outcome RunOverRanges(FlashDevice& device, const std::string& name, const ChosenRanges& chosen,
                      const RangeSteps& steps) {
    const RangeOperation& operation = *FindRangeOperation(name);
    std::vector<base::AddressRange> erased;
    std::uint64_t bytes = 0;
    for (const base::AddressRange& range : chosen.ranges) {
        Select(device, operation, chosen, range);
        if (const auto covered = Announce(device, operation, steps.verifyErase))
            erased.push_back(*covered);
        bytes += range.Size();
    }
    for (const base::AddressRange& range : chosen.ranges) {
        Select(device, operation, chosen, range);
        device.Perform(name, Verbosity::Verbose);
        if (steps.afterEach) steps.afterEach(range);
    }
    Outcome outcome = Finish(device, name, erased);
    outcome.result.update({{"address", chosen.ranges.front().first},
                           {"bytes", bytes},
                           {"ranges", ToJson(chosen.ranges)}});
    return outcome;
}

Json ToJson(const std::vector<base::AddressRange>& ranges) {
    Json all = Json::array();
    for (const base::AddressRange& range : ranges)
        all.push_back({{"address", range.first}, {"bytes", range.Size()}});
    return all;
}

}  // namespace host
