// corvane-flash completion: prints a shell's completion script, and answers what the scripts ask.

#include "host/cli/Completion.h"

#include <fmt/format.h>

#include "host/cli/CompletionScripts.h"
#include "host/commands/Command.h"
#include "host/commands/Commands.h"

namespace host::commands {

namespace {

constexpr char kWords[] = "words";

struct CompletionOptions {
    std::string shell;
    std::vector<std::string> words;
};

Outcome Answer(Context& context, const std::vector<std::string>& line) {
    const Completions offered = Complete(AllCommands(), line);
    Json words = Json::array();
    for (const auto& [text, help] : offered.words) {
        context.reporter.Result(fmt::format("{}\t{}", text, help));
        words.push_back({{"word", text}, {"help", help}});
    }
    if (offered.filesBehind)
        context.reporter.Result(fmt::format("{}\t{}", kFilesMark, *offered.filesBehind));
    return {.result = {
                {"words", words},
                {"filesBehind", offered.filesBehind ? Json(*offered.filesBehind) : Json(nullptr)}}};
}

Outcome RunCompletion(Context& context, const CompletionOptions& options) {
    if (options.shell == kWords) return Answer(context, options.words);
    std::string text;
    for (const CompletionScript& script : CompletionScripts())
        if (options.shell == script.shell) text = script.text;
    text.pop_back();  // the last line break comes with the result
    context.reporter.Document(text);
    return {.result = {{"shell", options.shell}, {"script", text}}};
}

std::vector<std::string> Choices() {
    std::vector<std::string> choices;
    for (const CompletionScript& script : CompletionScripts())
        choices.emplace_back(script.shell);
    choices.emplace_back(kWords);
    return choices;
}

}  // namespace

CommandRow Completion() {
    return Command<CompletionOptions>(
        {.name = "completion",
         .help = "Print the completion script of a shell",
         .details = "The scripts ask the tool itself what may stand at the cursor: 'completion "
                    "words -- WORD...' answers with a line for each word that may take the place "
                    "of the last WORD, with a tab before what it means.",
         .example = "  corvane-flash completion bash > "
                    "~/.local/share/bash-completion/completions/corvane-flash\n"
                    "  corvane-flash completion powershell | Out-String | Invoke-Expression\n"
                    "  corvane-flash completion words -- erase --",
         .needs = Needs::Nothing},
        {{&CompletionOptions::shell,
          {.names = "SHELL",
           .help = "bash, zsh, fish, powershell, or words",
           .choices = Choices(),
           .isRequired = true}},
         {&CompletionOptions::words,
          {.names = "WORD", .help = "The words of a command line up to the cursor"}}},
        RunCompletion);
}

}  // namespace host::commands
