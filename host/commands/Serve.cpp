// corvane-flash serve: a probe with flash added, or the simulated device, as a GDB server.

#include <fmt/format.h>

#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/flashing/ProbeServing.h"
#include "host/targets/TargetServer.h"

namespace host::commands {

namespace {

struct ServeOptions {
    std::string address;
};

template <typename Server>
Outcome ServeThere(Reporter& reporter, Server&& server) {
    reporter.WorksOn(server.Device());
    const Json where{{"host", server.Where().host}, {"port", server.Port()}};
    reporter.Listening(server.Where().Text(), where);
    server.Run();
    return {.result = where};
}

Outcome RunServe(Context& context, const ServeOptions& options) {
    Reporter& reporter = context.reporter;
    const TargetOptions& target = TargetOf(context.options);
    RequireOneKind(target);
    if (target.gdb) {
        std::optional<Trace> trace = OpenTrace(context);
        Outcome outcome = ServeThere(
            reporter, ProbeServing({target, context.options.plugin, trace ? &*trace : nullptr},
                                   options.address, context.settings, reporter));
        if (trace && !trace->Problem().empty())
            return {ExitStatus::BadFile, trace->Problem(), outcome.result};
        return outcome;
    }
    return ServeThere(
        reporter,
        TargetServer(
            target, options.address, [&](const std::string& text) { reporter.Error(text); },
            [&](const std::string& text) { reporter.Say(Verbosity::Normal, text); }));
}

}  // namespace

CommandRow Serve() {
    return Command<ServeOptions>(
        {.name = "serve",
         .help = "Serve a probe with flash added, or the simulated device",
         .details = "Until Ctrl-C, to one client at a time: others are told so. With --gdb, a "
                    "debugger finds the probe's GDB server here, and flash that it can load into; "
                    "what it can't be told is shown on standard error, and by 'monitor corvane'. "
                    "Without it, the simulated device is served: its code doesn't run, so a step "
                    "ends at once and a breakpoint is never hit; its contents are kept in "
                    "--sim-file whenever a client has gone; what it refuses is shown on standard "
                    "error. Without HOST only this machine can connect; port 0 takes a free one.",
         .example = "  corvane-flash serve 3333 --gdb :3334 --loader FlashLoaderMerrow.out\n"
                    "  corvane-flash --sim quen --sim-file board.sim serve 3333\n"
                    "  gdb-multiarch -ex 'target remote :3333' -ex load firmware.elf",
         .needs = Needs::ServedTarget},
        {{&ServeOptions::address,
          {.names = "[HOST:]PORT", .help = "Where to listen", .isRequired = true}}},
        RunServe);
}

}  // namespace host::commands
