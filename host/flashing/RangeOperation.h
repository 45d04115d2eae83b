// Running one of the plug-in's operations that work over a range, with what it will do said
// beforehand.

#pragma once

#include <functional>
#include <string>
#include <vector>

#include "host/base/Text.h"
#include "host/output/Reporter.h"
#include "host/settings/RangeSettings.h"

namespace host {

class FlashDevice;

/// What a command works over: the ranges that it was given, or else the whole flash.
struct ChosenRanges {
    std::vector<base::AddressRange> ranges;
    bool isWholeFlash = false;
};

/// The ranges of a command line, in its order. Failure (WrongUsage) when one doesn't lie in flash,
/// Failure (DeviceFailed) when there is no flash.
ChosenRanges ChooseRanges(FlashDevice& device, const std::vector<std::string>& texts);

/// The same in address order, with what overlaps or touches joined.
ChosenRanges ChooseJoinedRanges(FlashDevice& device, const std::vector<std::string>& texts);

/// Announces the work as the settings are, an erase as the sectors it covers; runs the operation,
/// any of the plug-in's, its messages shown at `level`; reads back what an erase has covered; and
/// shows the summary. The outcome holds the phases, and is a failure (ContentsDiffer) when the
/// erased range isn't blank.
Outcome RunOperation(FlashDevice& device, const std::string& name, Verbosity level);

/// What happens around an operation over several ranges.
struct RangeSteps {
    bool verifyErase = true;

    /// Called with each range that is done; what the plug-in has published is that of this one.
    std::function<void(const base::AddressRange&)> afterEach = {};
};

/// The same for Erase, BlankCheck or CalculateChecksum over one range after the other. The outcome
/// also holds the `ranges`, the first `address` and the `bytes` of all.
Outcome RunOverRanges(FlashDevice& device, const std::string& name, const ChosenRanges& chosen,
                      const RangeSteps& steps);

/// An array of `address` and `bytes`.
Json ToJson(const std::vector<base::AddressRange>& ranges);

}  // namespace host
