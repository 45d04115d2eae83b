// corvane-flash completion: prints a script that completes the tool's command lines in a shell.

#include "host/cli/Completion.h"
#include "host/commands/Commands.h"

namespace host::commands {

namespace {

Outcome Run(Context& context) {
    const std::string& shell = *context.options.argument;
    std::string script = CompletionScript(AllCommands(), shell);
    script.pop_back();  // the last line break comes with the result
    context.reporter.Result(script);
    return {.result = {{"shell", shell}, {"script", script}}};
}

}  // namespace

CommandRow Completion() {
    return {"completion",
            "Print the completion script of a shell: bash, zsh or fish",
            "",
            "  corvane-flash completion bash > ~/.local/share/bash-completion/completions/"
            "corvane-flash",
            {{"SHELL",
              "",
              "bash, zsh or fish",
              &Options::argument,
              Offers::Nothing,
              {"bash", "zsh", "fish"},
              true}},
            Run,
            false};
}

}  // namespace host::commands
