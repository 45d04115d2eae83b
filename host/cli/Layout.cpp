// Wrapping is by words: what is longer than a line stays whole.

#include "host/cli/Layout.h"

#include <fmt/format.h>

#include <algorithm>
#include <cstdio>
#include <vector>

#include "base/system/Terminal.h"
#include "host/cli/Words.h"

namespace host {

namespace {

constexpr std::size_t kPageColumns = 79;
constexpr std::size_t kNarrowIndent = 6;

std::size_t LineColumns() {
    static const std::size_t columns =
        std::clamp<std::size_t>(base::TerminalColumns(stdout), 21, kPageColumns + 1) - 1;
    return columns;
}

}  // namespace

std::string Wrap(std::string_view text, std::size_t column, std::size_t indent) {
    std::string lines;
    while (!text.empty()) {
        const std::string_view word = text.substr(0, text.find(' '));
        const bool first = column <= indent;
        if (!first && column + 1 + word.size() > LineColumns()) {
            lines += "\n" + std::string(indent, ' ');
            column = indent;
        } else if (!first) {
            lines += ' ';
            ++column;
        }
        lines += word;
        column += word.size();
        text.remove_prefix(std::min(text.size(), word.size() + 1));
    }
    return lines + "\n";
}

std::string Entry(const std::string& term, std::string_view text, std::size_t termColumns) {
    const std::size_t indent = LineColumns() < 2 * termColumns ? kNarrowIndent : termColumns;
    std::string line = "  " + term;
    if (line.size() + 1 < indent)
        line.append(indent - line.size(), ' ');
    else
        line += "\n" + std::string(indent, ' ');
    return line + Wrap(text, indent, indent);
}

std::string OptionEntry(const OptionRow& row) {
    const std::vector<std::string> names = row.Names();
    std::string term = names.front();
    if (names.size() > 1)
        term += ", " + names.back();
    else if (!row.IsArgument())
        term.insert(0, 4, ' ');
    std::string help = row.help;
    if (*row.value != '\0') term += fmt::format(" {}", row.value);
    if (*row.environment != '\0') help += fmt::format(" [environment: {}]", row.environment);
    return Entry(term, help);
}

}  // namespace host
