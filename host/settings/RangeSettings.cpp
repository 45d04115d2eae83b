// Writing and reading a selection with its two addresses.

#include "host/settings/RangeSettings.h"

#include "base/Hex.h"

namespace host {

void SelectRange(SettingStore& settings, const RangeKeys& keys,
                 const std::optional<base::AddressRange>& range) {
    const auto choose = [&](const char* key, const std::string& text) {
        settings.Set(Origin::CommandLine, key, text);
    };
    choose(keys.selection, range ? keys::kByAddressRange : keys::kEntireFlash);
    if (!range) return;
    choose(keys.start, base::HexText(range->first));
    choose(keys.end, base::HexText(range->last));
}

std::optional<base::AddressRange> SelectedRange(const SettingStore& settings,
                                                const RangeKeys& keys) {
    if (settings.Text(keys.selection) == keys::kEntireFlash) return std::nullopt;
    return base::AddressRange{base::ParseHex32(settings.Text(keys.start)).value_or(0),
                              base::ParseHex32(settings.Text(keys.end)).value_or(0)};
}

}  // namespace host
