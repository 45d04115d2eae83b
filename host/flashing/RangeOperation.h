// Running one of the plug-in's operations that work over a range, with what it will do said
// beforehand.

#pragma once

#include <optional>
#include <string>

#include "host/base/Text.h"
#include "host/output/Reporter.h"
#include "host/settings/RangeSettings.h"

namespace host {

class FlashDevice;

/// Makes the settings select what a command's --range said; without one, the whole flash. Returns
/// the range. Failure (WrongUsage) when it doesn't lie in flash.
base::AddressRange ChooseRange(FlashDevice& device, const RangeKeys& keys,
                               const std::optional<std::string>& text);

/// Announces the work as the settings are, an erase as the sectors it covers; runs the operation,
/// any of the plug-in's, its messages shown at `level`; reads back what an erase has covered unless
/// that is unwanted; and shows the summary. The outcome holds the phases, and is a failure
/// (ContentsDiffer) when the erased range isn't blank.
Outcome RunOperation(FlashDevice& device, const std::string& name, Verbosity level,
                     bool verifyErase = true);

}  // namespace host
