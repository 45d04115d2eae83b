// corvane-flash serve: the simulated device as a GDB server.

#include <fmt/format.h>

#include "host/commands/Commands.h"
#include "host/targets/TargetServer.h"

namespace host::commands {

namespace {

Outcome RunServe(Context& context) {
    Reporter& reporter = context.reporter;
    TargetServer server(
        TargetOf(context.options), *context.options.argument,
        [&](const std::string& text) { reporter.Error(text); },
        [&](const std::string& text) { reporter.Say(Talk::Normal, text); });
    const Json where{{"host", server.Where().host}, {"port", server.Port()}};
    reporter.Listening(server.Where().Text(), where);
    server.Run();
    return {.result = where};
}

}  // namespace

CommandRow Serve() {
    return {"serve",
            "Serve the simulated device as a GDB server, until Ctrl-C",
            "For GDB (target remote :PORT, then load), and for hosts to be tested. One client at a "
            "time; the contents are kept in --sim-file whenever one has gone. What the device "
            "refuses is shown on standard error. Without HOST only this machine can connect; port "
            "0 takes a free one.",
            "  corvane-flash --sim quen --sim-file board.sim serve 3333\n"
            "  gdb-multiarch -ex 'target remote :3333' -ex load firmware.elf",
            {{"[HOST:]PORT", "", "Where to listen", &Options::argument, Offers::Nothing, {}, true}},
            RunServe,
            false,
            true};
}

}  // namespace host::commands
