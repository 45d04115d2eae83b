// Writing and reading a selection with its two addresses.

#include "host/settings/RangeSettings.h"

namespace host {

void SelectRange(SettingStore& settings, const RangeKeys& keys,
                 const std::optional<AddressRange>& range) {
    const auto choose = [&](const char* key, const std::string& text) {
        settings.Set(Origin::CommandLine, key, text);
    };
    choose(keys.selection, range ? keys::kByAddressRange : keys::kEntireFlash);
    if (!range) return;
    choose(keys.start, HexText(range->first));
    choose(keys.end, HexText(range->last));
}

std::optional<AddressRange> SelectedRange(const SettingStore& settings, const RangeKeys& keys) {
    if (settings.Text(keys.selection) == keys::kEntireFlash) return std::nullopt;
    return AddressRange{HexNumber(settings.Text(keys.start)).value_or(0),
                        HexNumber(settings.Text(keys.end)).value_or(0)};
}

}  // namespace host
