// See UserOperation.h.

#include "host/commands/UserOperation.h"

#include <fmt/format.h>

#include "host/FlashDevice.h"
#include "host/ProgramPlan.h"
#include "host/SettingKeys.h"
#include "host/commands/Summary.h"

namespace host {

const RangeKeys kEraseKeys{keys::kEraseType, keys::kEraseStart, keys::kEraseEnd};
const RangeKeys kBlankCheckKeys{keys::kBlankCheckSelection, keys::kBlankCheckStart,
                                keys::kBlankCheckEnd};
const RangeKeys kChecksumKeys{keys::kChecksumSelection, keys::kChecksumStart, keys::kChecksumEnd};

namespace {

/// What an operation works on, and the unit that it widens its range to (0: a sector).
struct RangeOperation {
    const char* name;
    Phase phase;
    const RangeKeys& keys;
    std::uint32_t unitBytes;
};

const RangeOperation kRangeOperations[] = {
    {"Erase", Phase::Erase, kEraseKeys, 0},
    {"BlankCheck", Phase::BlankCheck, kBlankCheckKeys, 4},
    {"CalculateChecksum", Phase::Checksum, kChecksumKeys, 1},
};

/// The range that the settings select; nothing when the plug-in will refuse it or do nothing.
std::optional<AddressRange> SelectedRange(const SettingStore& settings, const DeviceInfo& info,
                                          const RangeKeys& keys) {
    if (!info.hasFlash) return std::nullopt;
    if (settings.Text(keys.selection) == keys::kEntireFlash) return info.Flash();
    const AddressRange range{HexNumber(settings.Text(keys.start)).value_or(0),
                             HexNumber(settings.Text(keys.end)).value_or(0)};
    if (range.first > range.last || range.last >= info.flashBytes) return std::nullopt;
    return range;
}

}  // namespace

AddressRange SelectRange(Context& context, FlashDevice& device, const RangeKeys& keys,
                         const std::optional<std::string>& text) {
    const AddressRange range = device.RangeInFlash(text);
    const auto choose = [&](const char* key, const std::string& value) {
        context.settings.Set(Origin::CommandLine, key, value);
    };
    choose(keys.selection, text ? keys::kByAddressRange : keys::kEntireFlash);
    choose(keys.start, HexText(range.first));
    choose(keys.end, HexText(range.last));
    return range;
}

void AnnounceOperation(Context& context, FlashDevice& device, const std::string& name) {
    const DeviceInfo& info = device.Info();
    for (const RangeOperation& operation : kRangeOperations) {
        if (name != operation.name) continue;
        const auto range = SelectedRange(context.settings, info, operation.keys);
        if (!range) return;
        const AddressRange covered = SectorsCovering(
            *range, operation.unitBytes == 0 ? info.sectorBytes : operation.unitBytes);
        device.Meter().Expect(operation.phase, covered.Size());
        if (operation.phase == Phase::Erase)
            context.reporter.Say(
                Talk::Normal, fmt::format("Erase covers {}: {}", RangeText(covered),
                                          CountText(covered.Size() / info.sectorBytes, "sector")));
    }
}

Outcome RunOperation(Context& context, FlashDevice& device, const std::string& name) {
    AnnounceOperation(context, device, name);
    device.Perform(name);
    ShowSummary(context.reporter, device.Meter());
    return {.result = {{"operation", name}, {"phases", PhasesJson(device.Meter())}}};
}

}  // namespace host
