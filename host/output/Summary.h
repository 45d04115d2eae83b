// The end of a run: what was erased, written and compared, and how long each phase took.

#pragma once

#include "host/base/Json.h"
#include "host/output/Phases.h"
#include "host/output/Reporter.h"

namespace host {

/// One line for each phase that was run, for people who haven't asked for quiet.
void ShowSummary(Reporter& reporter, const PhaseRecord& phases);

/// The same for the end line: {"erase": {"bytes": 2048, "seconds": 0.02}, ...}.
Json PhasesJson(const PhaseRecord& phases);

}  // namespace host
