// The table of the kinds of target, and the choice among them.

#include "host/targets/OpenTarget.h"

#include "host/base/Errors.h"
#include "host/targets/GdbServerTarget.h"
#include "host/targets/SimulatedTarget.h"

namespace host {

namespace {

struct Kind {
    bool (*asked)(const TargetOptions& options);
    std::unique_ptr<OpenTarget> (*open)(const TargetOptions& options, const TraceLine& trace,
                                        const WaitNotice& say);
};

// The last one is what a command line without any such option gets.
constexpr Kind kKinds[] = {
    {[](const TargetOptions& options) { return options.gdb.has_value(); },
     [](const TargetOptions& options, const TraceLine& trace,
        const WaitNotice&) -> std::unique_ptr<OpenTarget> {
         return std::make_unique<GdbServerTarget>(options, trace);
     }},
    {[](const TargetOptions&) { return true; },
     [](const TargetOptions& options, const TraceLine&,
        const WaitNotice& say) -> std::unique_ptr<OpenTarget> {
         return std::make_unique<SimulatedTarget>(options, say);
     }},
};

}  // namespace

void RequireOneKind(const TargetOptions& options) {
    if (options.gdb && (options.sim || options.simFile))
        throw Failure(ExitStatus::WrongUsage,
                      "--gdb names a real target, --sim and --sim-file a simulated one; give one "
                      "of them");
    if (!options.gdb && (!options.gdbOptions.empty() || options.loader || options.wait))
        throw Failure(ExitStatus::WrongUsage,
                      "--gdb-option, --loader and --wait are for a target behind --gdb HOST:PORT");
}

Json ToJson(const TargetOptions& options) {
    const auto text = [](const std::optional<std::string>& given) {
        return given ? Json(*given) : Json(nullptr);
    };
    if (!options.gdb)
        return {{"kind", "simulated"}, {"sim", text(options.sim)}, {"file", text(options.simFile)}};
    if (options.sim || options.simFile) return nullptr;
    return {{"kind", "gdb"}, {"server", text(options.gdb)}};
}

std::unique_ptr<OpenTarget> Open(const TargetOptions& options, const TraceLine& trace,
                                 const WaitNotice& say) {
    RequireOneKind(options);
    for (const Kind& kind : kKinds)
        if (kind.asked(options)) return kind.open(options, trace, say);
    return nullptr;
}

}  // namespace host
