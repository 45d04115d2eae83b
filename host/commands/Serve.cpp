// corvane-flash serve: the simulated device as a GDB server.

#include <fmt/format.h>

#include "host/commands/Command.h"
#include "host/commands/Commands.h"
#include "host/targets/TargetServer.h"

namespace host::commands {

namespace {

struct ServeOptions {
    std::string address;
};

Outcome RunServe(Context& context, const ServeOptions& options) {
    Reporter& reporter = context.reporter;
    TargetServer server(
        TargetOf(context.options), options.address,
        [&](const std::string& text) { reporter.Error(text); },
        [&](const std::string& text) { reporter.Say(Verbosity::Normal, text); });
    const Json where{{"host", server.Where().host}, {"port", server.Port()}};
    reporter.Listening(server.Where().Text(), where);
    server.Run();
    return {.result = where};
}

}  // namespace

CommandRow Serve() {
    return Command<ServeOptions>(
        {.name = "serve",
         .help = "Serve the simulated device as a GDB server, until Ctrl-C",
         .details =
             "For GDB (target remote :PORT, then load), and for hosts to be tested. One "
             "client at a time: others are told so. Code in its flash doesn't run, so a step "
             "ends at once and a breakpoint is never hit. The contents are kept in --sim-file "
             "whenever one has gone. "
             "What the device refuses is shown on standard error. Without HOST only this "
             "machine can connect; port 0 takes a free one.",
         .example = "  corvane-flash --sim quen --sim-file board.sim serve 3333\n"
                    "  gdb-multiarch -ex 'target remote :3333' -ex load firmware.elf",
         .readsSettings = false,
         .isForSimulated = true},
        {{&ServeOptions::address,
          {.names = "[HOST:]PORT", .help = "Where to listen", .isRequired = true}}},
        RunServe);
}

}  // namespace host::commands
