// corvane-flash help: the help of the tool, of a command or of a topic.

#include "host/cli/Help.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include "host/commands/Command.h"
#include "host/commands/Commands.h"

namespace host::commands {

namespace {

struct HelpOptions {
    std::vector<std::string> about;
};

Outcome RunHelp(Context& context, const HelpOptions& options) {
    const std::string about = fmt::format("{}", fmt::join(options.about, " "));
    std::string text = HelpText(AllCommands(), about);
    text.pop_back();  // the last line break comes with the result
    context.reporter.Document(text);
    return {.result = {{"about", about}, {"text", text}}};
}

}  // namespace

CommandRow Help() {
    return Command<HelpOptions>({.name = "help",
                                 .help = "Explain a command or a topic",
                                 .example = "  corvane-flash help program\n"
                                            "  corvane-flash help mac read\n"
                                            "  corvane-flash help sim",
                                 .needs = Needs::Nothing},
                                {{&HelpOptions::about,
                                  {.names = "COMMAND",
                                   .help = "A command or a topic; default: what there is",
                                   .offers = Offers::HelpWords}}},
                                RunHelp);
}

}  // namespace host::commands
