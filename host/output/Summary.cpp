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
        const std::string time =
            meter.SimulatesTime() ? DurationText(progress.simulatedSeconds) + " of simulated time"
                                  : DurationText(progress.seconds);
        reporter.Result(fmt::format("{:<13} {:<10} in {}", kPhaseNames[i].done,
                                    SizeText(progress.doneBytes), time));
    }
}

Json PhasesJson(const WorkMeter& meter) {
    Json phases = Json::object();
    for (std::size_t i = 0; i < kPhaseNames.size(); ++i) {
        const PhaseProgress& progress = meter.Of(static_cast<Phase>(i));
        if (progress.doneBytes == 0) continue;
        Json& phase = phases[kPhaseNames[i].id] = {{"bytes", progress.doneBytes},
                                                   {"seconds", SecondsJson(progress.seconds)}};
        if (meter.SimulatesTime())
            phase["simulatedSeconds"] = SecondsJson(progress.simulatedSeconds);
    }
    return phases;
}

}  // namespace host
