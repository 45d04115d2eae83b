// The words before the cursor are followed as the parser does it; they say what its word can be.

#include "host/cli/Completion.h"

#include <fmt/format.h>

#include "host/cli/FollowedLine.h"
#include "host/cli/OfferedValues.h"
#include "host/cli/Topics.h"
#include "host/cli/Words.h"

namespace host {

namespace {

class Completer {
  public:
    Completer(const CommandRows& commands, const FollowedLine& line)
        : commands_(commands), line_(line) {}

    Completions At(const std::string& cursor) const {
        if (line_.awaited != nullptr)
            return IsTaken(*line_.awaited) ? Completions()
                                           : OfferedValues(*line_.awaited, "", cursor);
        if (!line_.optionsEnded && cursor.starts_with('-')) return AtOption(cursor);
        if (line_.command == nullptr)
            return line_.MayNameCommand() ? CommandWords(line_.name) : Completions();
        const Completions arguments = AtArgument(cursor);
        const bool none = arguments.words.empty() && !arguments.filesBehind;
        return none && !line_.optionsEnded ? OptionWords(line_.command->options) : arguments;
    }

  private:
    /// Whether an option is there already and can't be there again.
    bool IsTaken(const OptionRow& row) const {
        return !row.isRepeated && line_.Has(row.LongName());
    }

    Completions AtOption(const std::string& cursor) const {
        if (const auto equals = cursor.find('='); equals != std::string::npos) {
            const OptionRow* row = line_.FindOption(cursor.substr(0, equals));
            if (row == nullptr || row->isSwitch || IsTaken(*row)) return {};
            return OfferedValues(*row, cursor.substr(0, equals + 1), cursor.substr(equals + 1));
        }
        Completions offered = OptionWords(CommonRows());
        if (line_.command != nullptr) {
            const Completions own = OptionWords(line_.command->options);
            offered.words.insert(offered.words.begin(), own.words.begin(), own.words.end());
        }
        for (const OptionRow& row : AnsweredRows())
            if (line_.name.empty() || row.LongName() == "--help")
                offered.words.push_back({row.LongName(), row.help});
        return offered;
    }

    /// Those that aren't there already, or may be there again.
    Completions OptionWords(const std::vector<OptionRow>& rows) const {
        Completions offered;
        for (const OptionRow& row : rows) {
            if (row.IsArgument() || IsTaken(row)) continue;
            for (const std::string& name : row.Names())
                offered.words.push_back({name, row.help});
        }
        return offered;
    }

    Completions CommandWords(const std::string& before) const {
        Completions offered;
        if (before.empty())
            for (const std::string& word : FirstWords(commands_))
                offered.words.push_back({word, FirstWordHelp(commands_, word)});
        for (const std::string& word : SecondWords(commands_, before))
            offered.words.push_back(
                {word, FirstWordHelp(commands_, fmt::format("{} {}", before, word))});
        return offered;
    }

    Completions AtArgument(const std::string& cursor) const {
        const OptionRow* row = line_.NextArgument();
        if (row == nullptr) return {};
        return row->offers == Offers::HelpWords ? HelpWords() : OfferedValues(*row, "", cursor);
    }

    Completions HelpWords() const {
        std::vector<std::string> words;
        for (const GivenOption& given : line_.given)
            if (given.row->IsArgument()) words.push_back(given.value);
        if (words.size() > 1) return {};
        Completions offered = CommandWords(words.empty() ? "" : words.front());
        if (words.empty())
            for (const Topic& topic : Topics())
                offered.words.push_back({topic.name, topic.help});
        return offered;
    }

    const CommandRows& commands_;
    const FollowedLine& line_;
};

}  // namespace

Completions Complete(const CommandRows& commands, const std::vector<std::string>& line) {
    std::vector<std::string> before = line;
    const std::string cursor = line.empty() ? "" : line.back();
    if (!line.empty()) before.pop_back();
    return Completer(commands, FollowLine(commands, before)).At(cursor);
}

}  // namespace host
