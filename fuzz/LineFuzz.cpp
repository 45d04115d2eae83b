// Command lines: a word in each line of the input. Whatever stands there, it is parsed or refused
// in words, and what the completion offers at its end is what the parser takes.

#include <optional>
#include <sstream>
#include <string>
#include <vector>

#include "fuzz/Require.h"
#include "host/base/Errors.h"
#include "host/cli/CommandLine.h"
#include "host/cli/Completion.h"
#include "host/commands/Commands.h"

namespace {

using namespace host;
using Words = std::vector<std::string>;

void Parse(const FollowedLine& line) {
    try {
        const ParsedLine parsed =
            ParseCommandLine(AllCommands(), line, [](const char*) { return std::nullopt; });
        Require((parsed.command == nullptr) != parsed.answer.empty(),
                "it is a command or answered");
        Require(parsed.command == nullptr || (line.complaint.empty() && line.strays.empty()),
                "what makes no sense isn't run");
    } catch (const Failure& failure) {
        Require(failure.Status() == ExitStatus::WrongUsage, "a refusal is of the line");
        RequireText(failure.what());
    }
}

/// The last word is the one at the cursor.
void CompleteAt(Words words) {
    const Completions offered = Complete(AllCommands(), words);
    words.pop_back();
    const FollowedLine before = FollowLine(AllCommands(), words);
    for (const Completions::Word& word : offered.words) {
        words.push_back(word.text);
        const FollowedLine line = FollowLine(AllCommands(), words);
        words.pop_back();
        Require(line.strays.size() == before.strays.size(), "an offered word has a place");
        Require(line.complaint == before.complaint, "an offered word is no mistake");
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::istringstream lines(std::string(data, data + size));
    Words words;
    for (std::string word; std::getline(lines, word);)
        words.push_back(word);
    Parse(FollowLine(AllCommands(), words));
    if (!words.empty()) CompleteAt(words);
    return 0;
}
