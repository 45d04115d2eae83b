// The plug-in's settings for a program load: what they ask for, and what a plan makes of them.

#pragma once

#include "host/flashing/LoadPlan.h"
#include "host/flashing/LoadRequest.h"
#include "host/settings/SettingStore.h"

namespace host {

/// The load that the settings ask for.
LoadRequest RequestedLoad(const SettingStore& settings);

/// Makes the settings of this run say what the plan does. A text that says it already stays as the
/// user has written it.
void WriteProgramSettings(SettingStore& settings, const LoadPlan& plan);

}  // namespace host
