// Running one of the plug-in's named operations, with what it will do said beforehand.

#pragma once

#include <optional>
#include <string>

#include "host/CommandTable.h"
#include "host/Text.h"

namespace host {

class FlashDevice;

/// The settings that select what an operation covers.
struct RangeKeys {
    const char* selection;
    const char* start;
    const char* end;
};

extern const RangeKeys kEraseKeys;
extern const RangeKeys kBlankCheckKeys;
extern const RangeKeys kChecksumKeys;

/// Makes the settings say what a command's --range said; without one, the whole flash. Returns the
/// range. Failure (WrongUsage) when it doesn't lie in flash.
AddressRange SelectRange(Context& context, FlashDevice& device, const RangeKeys& keys,
                         const std::optional<std::string>& range);

/// Announces the work of the operation as the settings are, an erase as the sectors it covers.
void AnnounceOperation(Context& context, FlashDevice& device, const std::string& name);

/// Announces the work, runs the operation, shows the summary. The outcome holds the phases.
Outcome RunOperation(Context& context, FlashDevice& device, const std::string& name);

}  // namespace host
