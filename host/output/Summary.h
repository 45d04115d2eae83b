// The end of a run: what was erased, written and compared, and how long each phase took.

#pragma once

#include "host/base/Json.h"
#include "host/output/Reporter.h"
#include "host/output/WorkMeter.h"

namespace host {

/// One line for each phase that was run, for people who haven't asked for quiet.
void ShowSummary(Reporter& reporter, const WorkMeter& meter);

/// The same for the end line: {"erase": {"bytes": 2048, "seconds": 0.02}, ...}.
Json PhasesJson(const WorkMeter& meter);

}  // namespace host
