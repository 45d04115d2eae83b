// Options with a place for their values: what ties a row of the tables to a member of a plain
// struct. Each command has such a struct, and there is one of the options that all commands take.

#pragma once

#include <functional>
#include <optional>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "host/cli/OptionRow.h"

namespace host {

// How the kinds of members take a text: one value, or all of them.
inline void TakeText(bool& member, const std::string& /*text*/) {
    member = true;
}
inline void TakeText(int& member, const std::string& /*text*/) {
    ++member;
}
inline void TakeText(std::string& member, const std::string& text) {
    member = text;
}
inline void TakeText(std::optional<std::string>& member, const std::string& text) {
    member = text;
}
inline void TakeText(std::vector<std::string>& member, const std::string& text) {
    member.push_back(text);
}

/// An option of commands whose options are a `Values`. A member's type says whether the option
/// takes a value (all but bool and int, which counts) and may be repeated (a vector and a count).
template <typename Values>
class Option {
  public:
    template <typename Owner, typename Member>
    Option(Member Owner::*member, OptionRow row)
        : row_(std::move(row)), take_([member](Values& values, const std::string& text) {
              TakeText(values.*member, text);
          }) {
        row_.isSwitch = std::is_same_v<Member, bool> || std::is_same_v<Member, int>;
        row_.isRepeated =
            std::is_same_v<Member, int> || std::is_same_v<Member, std::vector<std::string>>;
    }

    /// An option that several commands share: their structs have its struct as a base.
    template <typename Shared>
    requires(std::is_base_of_v<Shared, Values> && !std::is_same_v<Shared, Values>)
        Option(const Option<Shared>& shared)
        : row_(shared.Row()),
          take_([shared](Values& values, const std::string& text) { shared.Take(values, text); }) {}

    const OptionRow& Row() const { return row_; }
    void Take(Values& values, const std::string& text) const { take_(values, text); }

  private:
    OptionRow row_;
    std::function<void(Values&, const std::string&)> take_;
};

template <typename Values>
std::vector<OptionRow> RowsOf(const std::vector<Option<Values>>& options) {
    std::vector<OptionRow> rows;
    rows.reserve(options.size());
    for (const Option<Values>& option : options)
        rows.push_back(option.Row());
    return rows;
}

/// What is given of some options, by their names: an option of a command that bears the name of
/// one of all commands is both.
template <typename Values>
Values ValuesOf(const std::vector<Option<Values>>& options, const GivenOptions& given) {
    Values values;
    for (const GivenOption& one : given)
        for (const Option<Values>& option : options)
            if (option.Row().LongName() == one.row->LongName()) option.Take(values, one.value);
    return values;
}

}  // namespace host
