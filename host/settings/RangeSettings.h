// The settings that select what an operation covers: the whole flash, or a range of addresses.

#pragma once

#include <optional>

#include "host/base/Text.h"
#include "host/facts/SettingKeys.h"
#include "host/settings/SettingStore.h"

namespace host {

struct RangeKeys {
    const char* selection;
    const char* start;
    const char* end;
};

inline constexpr RangeKeys kEraseKeys{keys::kEraseType, keys::kEraseStart, keys::kEraseEnd};
inline constexpr RangeKeys kBlankCheckKeys{keys::kBlankCheckSelection, keys::kBlankCheckStart,
                                           keys::kBlankCheckEnd};
inline constexpr RangeKeys kChecksumKeys{keys::kChecksumSelection, keys::kChecksumStart,
                                         keys::kChecksumEnd};

/// Makes the settings of this run select a range, or the whole flash where there is none.
void SelectRange(SettingStore& settings, const RangeKeys& keys,
                 const std::optional<base::AddressRange>& range);

/// The range that the settings select, nothing for the whole flash. Addresses are as the plug-in
/// reads them: they may lie in reverse order or beyond the flash.
std::optional<base::AddressRange> SelectedRange(const SettingStore& settings,
                                                const RangeKeys& keys);

}  // namespace host
