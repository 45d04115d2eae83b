// The words before the cursor are followed as the parser would, then the cursor's is looked at.

#include "host/cli/Completion.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstddef>
#include <string_view>

#include "host/cli/OfferedValues.h"
#include "host/cli/Topics.h"
#include "host/cli/Words.h"

namespace host {

namespace {

bool IsOption(const std::string& word) {
    return word.size() > 1 && word.front() == '-';
}

class Completer {
  public:
    explicit Completer(const CommandRows& commands) : commands_(commands) {}

    /// Takes a word that stands before the cursor.
    void Follow(const std::string& word) {
        if (awaiting_ != nullptr) {
            awaiting_ = nullptr;
        } else if (word == "--" && !onlyArguments_) {
            onlyArguments_ = true;
        } else if (IsOption(word) && !onlyArguments_) {
            FollowOption(word);
        } else if (onlyArguments_ || command_ != nullptr) {
            arguments_.push_back(word);
        } else {
            name_ += (name_.empty() ? "" : " ") + word;
            for (const CommandRow& row : commands_)
                if (name_ == row.name) command_ = &row;
        }
    }

    Completions At(const std::string& cursor) const {
        if (awaiting_ != nullptr) return OfferedValues(*awaiting_, "", cursor);
        if (!onlyArguments_ && !cursor.empty() && cursor.front() == '-') return AtOption(cursor);
        if (command_ == nullptr) return CommandWords(name_);
        const Completions arguments = AtArgument(cursor);
        const bool none = arguments.words.empty() && !arguments.filesBehind;
        return none ? OptionWords(command_->options) : arguments;
    }

  private:
    const OptionRow* Find(const std::string& name) const {
        const auto among = [&](const std::vector<OptionRow>& rows) -> const OptionRow* {
            for (const OptionRow& row : rows) {
                const auto names = SplitNames(row);
                if (std::find(names.begin(), names.end(), name) != names.end()) return &row;
            }
            return nullptr;
        };
        const OptionRow* row = command_ == nullptr ? nullptr : among(command_->options);
        return row != nullptr ? row : among(GlobalOptions());
    }

    void FollowOption(const std::string& word) {
        const OptionRow* row = Find(word.substr(0, word.find('=')));
        if (row == nullptr) return;
        given_.push_back(row);
        if (!row->IsSwitch() && word.find('=') == std::string::npos) awaiting_ = row;
    }

    Completions AtOption(const std::string& cursor) const {
        if (const auto equals = cursor.find('='); equals != std::string::npos) {
            const OptionRow* row = Find(cursor.substr(0, equals));
            if (row == nullptr || row->IsSwitch()) return {};
            return OfferedValues(*row, cursor.substr(0, equals + 1), cursor.substr(equals + 1));
        }
        Completions offered = OptionWords(GlobalOptions());
        if (command_ != nullptr) {
            const Completions own = OptionWords(command_->options);
            offered.words.insert(offered.words.begin(), own.words.begin(), own.words.end());
        }
        offered.words.push_back({"--help", "Show the help"});
        if (name_.empty()) offered.words.push_back({"--version", "Show the version"});
        return offered;
    }

    /// Those that aren't there already, or may be there again.
    Completions OptionWords(const std::vector<OptionRow>& rows) const {
        Completions offered;
        for (const OptionRow& row : rows) {
            const bool given = std::find(given_.begin(), given_.end(), &row) != given_.end();
            if (row.IsArgument() || (given && !row.IsRepeated())) continue;
            for (const std::string& name : SplitNames(row))
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
        std::vector<const OptionRow*> rows;
        for (const OptionRow& row : command_->options)
            if (row.IsArgument()) rows.push_back(&row);
        if (rows.empty()) return {};
        const std::size_t index = arguments_.size();
        if (index >= rows.size() && !rows.back()->IsRepeated()) return {};
        const OptionRow& row = *rows[std::min(index, rows.size() - 1)];
        return row.offers == Offers::HelpWords ? HelpWords() : OfferedValues(row, "", cursor);
    }

    Completions HelpWords() const {
        if (arguments_.size() > 1) return {};
        Completions offered = CommandWords(arguments_.empty() ? "" : arguments_.front());
        if (arguments_.empty())
            for (const Topic& topic : Topics())
                offered.words.push_back({topic.name, topic.help});
        return offered;
    }

    const CommandRows& commands_;
    std::string name_;  ///< the words so far that name the command
    const CommandRow* command_ = nullptr;
    const OptionRow* awaiting_ = nullptr;  ///< the option whose value comes next
    std::vector<const OptionRow*> given_;
    std::vector<std::string> arguments_;
    bool onlyArguments_ = false;
};

}  // namespace

Completions Complete(const CommandRows& commands, const std::vector<std::string>& line) {
    Completer completer(commands);
    for (std::size_t i = 0; i + 1 < line.size(); ++i)
        completer.Follow(line[i]);
    return completer.At(line.empty() ? "" : line.back());
}

}  // namespace host
