// The command line as pure functions: from a line to what it asks for or to a complaint, and from a
// line up to the cursor to what may stand there. One follower serves both.

#include <fmt/format.h>
#include <fmt/ranges.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "host/base/Errors.h"
#include "host/cli/CommandLine.h"
#include "host/cli/Completion.h"
#include "host/cli/Help.h"
#include "host/cli/ManPage.h"
#include "host/cli/Words.h"
#include "host/commands/Commands.h"
#include "tests/support/Cases.h"

namespace host {
namespace {

using Words = std::vector<std::string>;

/// The words of a line; '' is an empty one.
Words Split(const std::string& line) {
    std::istringstream stream(line);
    Words words;
    for (std::string word; stream >> word;)
        words.push_back(word == "''" ? "" : word);
    return words;
}

/// A project of two boards.
ProjectFile TwoBoards(const std::string& standard) {
    const Board bench{{{"--gdb", ":3"}, {"--gdb-option", "server=qemu"}, {"--loader", "l"}}, {}};
    return {"p", standard, {}, {{"bench", bench}, {"velk", {{{"--sim", "velk"}}, {}}}}};
}

/// The meaning as the rows tell it. Variables stand before the line's words; DEFAULT_BOARD is that
/// of a project.
std::string Meaning(Words words) {
    std::map<std::string, std::optional<std::string>> variables;
    while (!words.empty() &&
           (words.front().starts_with("CORVANE_") || words.front().starts_with("DEFAULT_"))) {
        const auto equals = words.front().find('=');
        variables[words.front().substr(0, equals)] = words.front().substr(equals + 1);
        words.erase(words.begin());
    }
    const FollowedLine line = FollowLine(AllCommands(), words);
    try {
        const ParsedLine parsed = ParseCommandLine(
            AllCommands(), line, [&](const char* name) { return variables[name]; },
            [&] {
                const auto board = variables.find("DEFAULT_BOARD");
                return board == variables.end() ? ProjectFile() : TwoBoards(*board->second);
            });
        static constexpr const char* kBy[] = {"", " (environment)", " (board)"};
        if (parsed.command == nullptr) return parsed.answer;
        std::string text = parsed.command->name;
        for (const GivenOption& given : parsed.given)
            text += fmt::format(" {}{}{}{}", given.row->LongName(), given.row->isSwitch ? "" : "=",
                                given.value, kBy[static_cast<int>(given.by)]);
        return text;
    } catch (const Failure& failure) {
        EXPECT_EQ(failure.Status(), ExitStatus::WrongUsage);
        return failure.what();
    }
}

TEST(CommandLine, MeansWhatTheHelpSays) {
    for (const auto& row : test::ReadTable("host/cli/meanings.txt", 2)) {
        const std::string meaning = Meaning(Split(row[0]));
        const bool isAnswer = meaning.ends_with('\n');
        EXPECT_EQ(isAnswer ? meaning.substr(0, row[1].size()) : meaning, row[1]) << row[0];
    }
}

TEST(Completion, OffersWhatMayStandAtTheCursor) {
    for (const auto& row : test::ReadTable("host/cli/offers.txt", 2)) {
        const Words line = Split(row[0]);
        const Completions offered = Complete(AllCommands(), line);
        Words words;
        for (const Completions::Word& word : offered.words)
            if (word.text.starts_with(line.back())) words.push_back(word.text);
        if (offered.filesBehind) words.push_back(":files" + *offered.filesBehind);
        EXPECT_EQ(fmt::format("{}", fmt::join(words, " ")), row[1]) << row[0];
    }
}

TEST(CommandTable, EveryCommandAndOptionIsInHelpAndManPage) {
    std::vector<std::string> words = FirstWords(AllCommands());
    std::vector<std::vector<std::string>> options;
    const auto add = [&](const std::vector<OptionRow>& rows) {
        for (const OptionRow& row : rows)
            if (!row.IsArgument()) options.push_back(row.Names());
    };
    add(CommonRows());
    std::string help = HelpText(AllCommands(), "options");
    std::string man = ManPage(AllCommands());
    man.erase(std::remove(man.begin(), man.end(), '\\'), man.end());
    for (const CommandRow& command : AllCommands()) {
        add(command.options);
        help += HelpText(AllCommands(), command.name);
        EXPECT_NE(man.find(std::string("corvane-flash ") + command.name), std::string::npos);
        EXPECT_NE(std::string(command.example).find(command.name), std::string::npos);
        for (std::istringstream lines(HelpText(AllCommands(), command.name)); !lines.eof();) {
            std::string line;
            std::getline(lines, line);
            EXPECT_TRUE(line.size() < 80 || line.starts_with("  corvane-flash")) << line;
        }
    }
    for (const std::vector<std::string>& names : options) {
        EXPECT_NE(help.find(names.front()), std::string::npos) << names.front();
        EXPECT_NE(man.find(names.back()), std::string::npos) << names.back();
    }
}

}  // namespace
}  // namespace host
