// corvane-flash help: the help of the tool, of a command or of a topic.

#include "host/cli/Help.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include "host/commands/Commands.h"

namespace host::commands {

namespace {

Outcome RunHelp(Context& context) {
    const std::string about = fmt::format("{}", fmt::join(context.options.words, " "));
    std::string text = HelpText(AllCommands(), about);
    text.pop_back();  // the last line break comes with the result
    context.reporter.Result(text);
    return {.result = {{"about", about}, {"text", text}}};
}

}  // namespace

CommandRow Help() {
    return {"help",
            "Explain a command or a topic",
            "",
            "  corvane-flash help program\n"
            "  corvane-flash help mac read\n"
            "  corvane-flash help sim",
            {{"COMMAND", "", "A command or a topic; default: what there is", &Options::words,
              Offers::HelpWords}},
            RunHelp,
            false};
}

}  // namespace host::commands
