// The summary, for people and as JSON.

#include "host/output/Summary.h"

#include <fmt/format.h>

#include "host/base/Text.h"

namespace host {

void ShowSummary(Reporter& reporter, const WorkMeter& meter) {
    if (!reporter.Hears(Talk::Normal)) return;
    for (std::size_t i = 0; i < kPhaseNames.size(); ++i) {
        const PhaseProgress& progress = meter.Of(static_cast<Phase>(i));
        if (progress.doneBytes == 0) continue;
        reporter.Result(fmt::format("{:<13} {:<10} in {}", kPhaseNames[i].done,
                                    SizeText(progress.doneBytes), DurationText(progress.seconds)));
    }
}

Json PhasesJson(const WorkMeter& meter) {
    Json phases = Json::object();
    for (std::size_t i = 0; i < kPhaseNames.size(); ++i) {
        const PhaseProgress& progress = meter.Of(static_cast<Phase>(i));
        if (progress.doneBytes != 0)
            phases[kPhaseNames[i].id] = {{"bytes", progress.doneBytes},
                                         {"seconds", SecondsJson(progress.seconds)}};
    }
    return phases;
}

}  // namespace host
