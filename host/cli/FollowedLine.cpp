// The rules for a word, in the order in which they are tried.

#include "host/cli/FollowedLine.h"

#include <fmt/format.h>

#include <algorithm>
#include <iterator>
#include <utility>

#include "host/base/Suggestion.h"
#include "host/cli/Words.h"

namespace host {

namespace {

/// "bash, zsh or fish"
std::string AnyOf(const std::vector<std::string>& words) {
    std::string text = words.front();
    for (std::size_t i = 1; i < words.size(); ++i)
        text += (i + 1 < words.size() ? ", " : " or ") + words[i];
    return text;
}

/// What is wrong with a value; empty when the rows have nothing against it.
std::string Objection(const OptionRow& row, const std::string& value) {
    const std::string name = row.LongName();
    if (row.offers == Offers::Files && value.empty())
        return fmt::format("{}: the name of the file is empty", name);
    const std::vector<std::string>& choices = row.choices;
    if (choices.empty() || row.offers == Offers::SomeChoices ||
        std::find(choices.begin(), choices.end(), value) != choices.end())
        return "";
    return fmt::format("{} can't be '{}'; it takes {}{}", name, value, AnyOf(choices),
                       Suggestion(value, choices));
}

class Follower {
  public:
    explicit Follower(const CommandRows& commands) : commands_(commands) {}

    void Take(const std::string& word) {
        if (line_.awaited != nullptr)
            TakeValue(word);
        else if (!line_.optionsEnded && word == "--")
            line_.optionsEnded = true;
        else if (!line_.optionsEnded && IsOption(word))
            TakeOption(word);
        else if (line_.MayNameCommand())
            TakeCommandWord(word);
        else
            TakeArgument(word);
    }

    FollowedLine Line() && { return std::move(line_); }

  private:
    void TakeValue(const std::string& word) {
        const OptionRow* row = std::exchange(line_.awaited, nullptr);
        if (word == "--") {
            Complain(ValueMissing(*row));
            line_.optionsEnded = true;
        } else {
            Give(*row, word);
        }
    }

    void TakeOption(const std::string& word) {
        const auto equals = word.find('=');
        const OptionRow* row = line_.FindOption(word.substr(0, equals));
        if (row == nullptr)
            TakeLetters(word);
        else if (equals == std::string::npos && row->isSwitch)
            Give(*row, "");
        else if (equals == std::string::npos)
            line_.awaited = row;
        else if (row->isSwitch)
            RefuseValue(*row, word, equals);
        else
            Give(*row, word.substr(equals + 1));
    }

    void RefuseValue(const OptionRow& row, const std::string& word, std::size_t equals) {
        line_.given.push_back({&row, word.substr(equals)});
        Complain(fmt::format("{} takes no value; leave out '{}'", word.substr(0, equals),
                             word.substr(equals)));
    }

    /// "-qv" is "-q -v".
    void TakeLetters(const std::string& word) {
        std::vector<const OptionRow*> rows;
        std::transform(word.begin() + 1, word.end(), std::back_inserter(rows), [&](char letter) {
            return line_.FindOption({'-', letter});
        });
        const bool known = std::all_of(rows.begin(), rows.end(), [](const OptionRow* row) {
            return row != nullptr && row->isSwitch;
        });
        if (!known) return AddStray(word);
        for (const OptionRow* row : rows)
            Give(*row, "");
    }

    void TakeCommandWord(const std::string& word) {
        const std::string name = line_.name.empty() ? word : line_.name + " " + word;
        for (const CommandRow& row : commands_)
            if (name == row.name) line_.command = &row;
        if (line_.command == nullptr && SecondWords(commands_, name).empty()) return AddStray(word);
        line_.name = name;
    }

    void TakeArgument(const std::string& word) {
        const OptionRow* row = line_.NextArgument();
        if (row == nullptr) return AddStray(word);
        Give(*row, word);
    }

    void Give(const OptionRow& row, const std::string& value) {
        const bool isOnce = !row.isSwitch && !row.isRepeated;
        if (isOnce && line_.Has(row.LongName()))
            Complain(fmt::format("{} is there twice, and it takes one value; leave one out",
                                 row.LongName()));
        line_.given.push_back({&row, value});
        Complain(Objection(row, value));
    }

    void AddStray(const std::string& word) { line_.strays.push_back({word, line_.optionsEnded}); }

    void Complain(const std::string& text) {
        if (line_.complaint.empty()) line_.complaint = text;
    }

    const CommandRows& commands_;
    FollowedLine line_;
};

}  // namespace

bool IsOption(const std::string& word) {
    return word.size() > 1 && word.front() == '-';
}

std::string ValueMissing(const OptionRow& row) {
    return fmt::format("{}: its value is missing", row.LongName());
}

bool FollowedLine::Has(const std::string& option) const {
    return std::any_of(given.begin(), given.end(),
                       [&](const GivenOption& one) { return one.row->LongName() == option; });
}

bool FollowedLine::MayNameCommand() const {
    return command == nullptr && !optionsEnded &&
           std::all_of(strays.begin(), strays.end(),
                       [](const StrayWord& stray) { return IsOption(stray.text); });
}

const OptionRow* FollowedLine::NextArgument() const {
    if (command == nullptr) return nullptr;
    const auto isTaken = [&](const OptionRow& row) { return !row.isRepeated && Has(row.names); };
    for (const OptionRow& row : command->options)
        if (row.IsArgument() && !isTaken(row)) return &row;
    return nullptr;
}

const OptionRow* FollowedLine::FindOption(const std::string& option) const {
    const auto among = [&](const std::vector<OptionRow>& rows) -> const OptionRow* {
        for (const OptionRow& row : rows)
            for (const std::string& known : row.Names())
                if (known == option && !row.IsArgument()) return &row;
        return nullptr;
    };
    const OptionRow* row = command == nullptr ? nullptr : among(command->options);
    if (row == nullptr) row = among(CommonRows());
    return row != nullptr ? row : among(AnsweredRows());
}

FollowedLine FollowLine(const CommandRows& commands, std::span<const std::string> words) {
    Follower follower(commands);
    for (const std::string& word : words)
        follower.Take(word);
    return std::move(follower).Line();
}

}  // namespace host
