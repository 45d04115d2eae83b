// The summary, for people and as JSON.

#include "host/output/Summary.h"

#include <fmt/format.h>

#include "host/base/Text.h"

namespace host {

void ShowSummary(Reporter& reporter, const PhaseRecord& phases) {
    if (!reporter.Hears(Verbosity::Normal)) return;
    for (std::size_t i = 0; i < kPhaseNames.size(); ++i) {
        const PhaseProgress& progress = phases[static_cast<Phase>(i)];
        if (progress.doneBytes == 0) continue;
        const std::string time =
            progress.simulatedSeconds
                ? DurationText(*progress.simulatedSeconds) + " of simulated time"
                : DurationText(progress.seconds);
        reporter.Result(fmt::format("{:<13} {:<10} in {}", kPhaseNames[i].done,
                                    SizeText(progress.doneBytes), time));
    }
}

Json PhasesJson(const PhaseRecord& phases) {
    Json all = Json::object();
    for (std::size_t i = 0; i < kPhaseNames.size(); ++i) {
        const PhaseProgress& progress = phases[static_cast<Phase>(i)];
        if (progress.doneBytes == 0) continue;
        Json& phase = all[kPhaseNames[i].id] = {{"bytes", progress.doneBytes},
                                                {"seconds", SecondsJson(progress.seconds)}};
        if (progress.simulatedSeconds)
            phase["simulatedSeconds"] = SecondsJson(*progress.simulatedSeconds);
    }
    return all;
}

}  // namespace host
