// corvane-flash completion: prints a shell's completion script, and answers what the scripts ask.

#include "host/cli/Completion.h"

#include <fmt/format.h>

#include "host/cli/CompletionScripts.h"
#include "host/commands/Commands.h"

namespace host::commands {

namespace {

constexpr char kWords[] = "words";

Outcome Answer(Context& context) {
    const Completions offered = Complete(AllCommands(), context.options.words);
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

Outcome RunCompletion(Context& context) {
    const std::string& shell = *context.options.argument;
    if (shell == kWords) return Answer(context);
    std::string text;
    for (const CompletionScript& script : CompletionScripts())
        if (shell == script.shell) text = script.text;
    text.pop_back();  // the last line break comes with the result
    context.reporter.Result(text);
    return {.result = {{"shell", shell}, {"script", text}}};
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
    return {"completion",
            "Print the completion script of a shell: bash, zsh or fish",
            "The scripts ask the tool itself what may stand at the cursor: 'completion words -- "
            "WORD...' answers with a line for each word that may take the place of the last WORD, "
            "with a tab before what it means.",
            "  corvane-flash completion bash > ~/.local/share/bash-completion/completions/"
            "corvane-flash\n"
            "  corvane-flash completion words -- erase --",
            {{"SHELL", "", "bash, zsh, fish, or words", &Options::argument, Offers::Nothing,
              Choices(), true},
             {"WORD", "", "The words of a command line up to the cursor", &Options::words}},
            RunCompletion,
            false};
}

}  // namespace host::commands
