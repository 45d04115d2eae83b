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

namespace host {
namespace {

using Words = std::vector<std::string>;

/// The words of a line; '' is an empty one, here and below.
Words Split(const std::string& line) {
    std::istringstream stream(line);
    Words words;
    for (std::string word; stream >> word;)
        words.push_back(word == "''" ? "" : word);
    return words;
}

struct LineRow {
    const char* line;
    const char* meaning;
};

// What a line means: the command, then each option and argument; an unnamed answer by its start.
const LineRow kMeanings[] = {
    {"info", "info"},
    {"--sim quen -vv program x y --crc",
     "program --sim=quen --verbose --verbose FILE=x FILE=y --crc"},
    {"program --crc x --sim tolva y -v --sim quen",
     "program --crc FILE=x --sim=tolva FILE=y --verbose --sim=quen"},
    {"mac --json read -q", "mac read --json --quiet"},
    {"-qv info", "info --quiet --verbose"},
    {"info --progress plain --progress=none", "info --progress=plain --progress=none"},
    {"help mac read", "help COMMAND=mac COMMAND=read"},
    {"completion words -- -- erase --a", "completion SHELL=words WORD=-- WORD=erase WORD=--a"},
    // A word is what it is, whatever else brackets and signs mean elsewhere.
    {"program [x] [a,b] ++ %% 'c' -",
     "program FILE=[x] FILE=[a,b] FILE=++ FILE=%% FILE='c' FILE=-"},
    {"program x -- --dry-run -q", "program FILE=x FILE=--dry-run FILE=-q"},
    {"info --trace --json --set a=b=c", "info --trace=--json --set=a=b=c"},
    {"info --sim= --set ''", "info --sim= --set="},
    {"program info", "program FILE=info"},
    // The environment's part.
    {"CORVANE_SIM=quen CORVANE_PLUGIN=p info",
     "info --sim=quen (environment) --plugin=p (environment)"},
    {"CORVANE_SIM=quen info --sim velk", "info --sim=velk"},
    {"CORVANE_SIM=quen CORVANE_SIM_FILE=f info --gdb=1", "info --gdb=1"},
    {"CORVANE_GDB=1 info --sim-file f", "info --sim-file=f"},
    {"CORVANE_GDB=1 CORVANE_SIM= serve 3", "serve [HOST:]PORT=3"},
    {"CORVANE_GDB=1 serve 3 --gdb 2", "serve [HOST:]PORT=3 --gdb=2"},
    // What is answered whatever else is wrong.
    {"-h", "Usage: corvane-flash [OPTION]..."},
    {"program --nonsense --help", "Program image files into flash"},
    {"mac foo --help --version", "Read or program the MAC address."},
    {"--version --help", "corvane-flash "},
    {"info --man", ".TH CORVANE"},
    // Complaints.
    {"''", "unknown command or option: ; 'corvane-flash --help' shows what there is"},
    {"",
     "which command? 'corvane-flash --help' lists them, for example 'corvane-flash program "
     "firmware.elf'"},
    {"porgram info --crc",
     "unknown command or option: porgram info --crc; did you mean 'program'?; "
     "'corvane-flash --help' shows what there is"},
    {"--qiet=1 info",
     "not expected here: --qiet=1; did you mean '--quiet'?; 'corvane-flash info "
     "--help' shows what there is"},
    {"--crc program x",
     "not expected here: --crc; write it behind 'program'; 'corvane-flash program "
     "--help' shows what there is"},
    {"--vers", "unknown command or option: --vers; 'corvane-flash --help' shows what there is"},
    {"-- info", "unknown command or option: info; 'corvane-flash --help' shows what there is"},
    {"info -1 -- --quiet",
     "not expected here: -1 --quiet; 'corvane-flash info --help' shows what there is"},
    {"info -- --quite",
     "not expected here: --quite; 'corvane-flash info --help' shows what there is"},
    {"-qx info", "not expected here: -qx; 'corvane-flash info --help' shows what there is"},
    {"mac info", "mac what? read or program; 'corvane-flash mac --help' shows what there is"},
    {"mac program 1 2",
     "not expected here: 2; 'corvane-flash mac program --help' shows what there is"},
    {"program x --dry-run=no",
     "--dry-run takes no value; leave out '=no'; 'corvane-flash program "
     "--help' shows what there is"},
    {"--json= info",
     "--json takes no value; leave out '='; 'corvane-flash info --help' shows what there is"},
    {"-q=1 info",
     "-q takes no value; leave out '=1'; 'corvane-flash info --help' shows what there is"},
    {"info --help=x",
     "--help takes no value; leave out '=x'; 'corvane-flash info --help' shows what there is"},
    {"info --trace",
     "--trace: its value is missing; 'corvane-flash info --help' shows what there is"},
    {"info --trace -- x",
     "--trace: its value is missing; 'corvane-flash info --help' shows what there is"},
    {"--sim", "--sim: its value is missing; 'corvane-flash --help' shows what there is"},
    {"info --progress plian",
     "--progress can't be 'plian'; it takes auto, bar, plain or none; did you "
     "mean 'plain'?; 'corvane-flash info --help' shows what there is"},
    {"register read 2",
     "INDEX can't be '2'; it takes 0 or 1; 'corvane-flash register read --help' "
     "shows what there is"},
    {"register program 1",
     "VALUE is required; 'corvane-flash register program --help' shows what there is"},
    {"program ''",
     "FILE: the name of the file is empty; 'corvane-flash program --help' shows what there is"},
};

/// The meaning as the rows tell it. Variables stand before the line's words.
std::string Meaning(Words words) {
    std::map<std::string, std::string> variables;
    while (!words.empty() && words.front().starts_with("CORVANE_")) {
        const auto equals = words.front().find('=');
        variables[words.front().substr(0, equals)] = words.front().substr(equals + 1);
        words.erase(words.begin());
    }
    const FollowedLine line = FollowLine(AllCommands(), words);
    try {
        const ParsedLine parsed = ParseCommandLine(
            AllCommands(), line, [&](const char* name) { return variables[name]; });
        if (parsed.command == nullptr) return parsed.answer;
        std::string text = parsed.command->name;
        for (const GivenOption& given : parsed.given)
            text += fmt::format(" {}{}{}{}", given.row->LongName(), given.row->isSwitch ? "" : "=",
                                given.value, given.isFromEnvironment ? " (environment)" : "");
        return text;
    } catch (const Failure& failure) {
        EXPECT_EQ(failure.Status(), ExitStatus::WrongUsage);
        return failure.what();
    }
}

TEST(CommandLine, MeansWhatTheHelpSays) {
    for (const LineRow& row : kMeanings) {
        const std::string meaning = Meaning(Split(row.line));
        const bool isAnswer = meaning.ends_with('\n');
        EXPECT_EQ(isAnswer ? meaning.substr(0, std::string(row.meaning).size()) : meaning,
                  row.meaning)
            << row.line;
    }
}

// What may stand at the cursor, the line's last word: those words that begin with it.
const LineRow kOffers[] = {
    {"''",
     "info program verify map read erase blank-check checksum register mac operation reset "
     "serve settings completion help"},
    {"nonsense ''", ""},
    {"-- ''", ""},
    {"--ve", "--verbose --version"},
    {"mac --v", "--verbose"},
    {"mac ''", "read program"},
    {"mac --json ''", "read program"},
    {"info ''", ""},
    {"program --crc --c", ""},
    {"program --crc --set a=b --set c=d --se", "--settings --set"},
    {"program -v -",
     "--format --base --erase --keep --blank-check --crc --rewrite --no-verify --run --dry-run "
     "--sim --sim-file --gdb --gdb-option --loader --settings --set --plugin --trace --force "
     "--progress --json -q --quiet -v --verbose --help"},
    {"program ''", ":files"},
    {"program -- x --", ":files"},
    {"program --erase a", "all"},
    {"program --erase=", "--erase=necessary --erase=none --erase=all"},
    {"program --erase --crc --bl", "--blank-check"},
    {"program --crc=", ""},
    {"read x ''", "--range --format"},
    {"register read ''", "0 1"},
    {"register program 1 0 ''", "--commit"},
    {"completion z", "zsh"},
    {"help ''",
     "info program verify map read erase blank-check checksum register mac operation "
     "reset serve settings completion help sim gdb options status"},
    {"help mac r", "read"},
    {"help mac read ''", ""},
    {"--trace ''", ":files"},
    {"--trace=", ":files--trace="},
};

TEST(Completion, OffersWhatMayStandAtTheCursor) {
    for (const LineRow& row : kOffers) {
        const Words line = Split(row.line);
        const Completions offered = Complete(AllCommands(), line);
        Words words;
        for (const Completions::Word& word : offered.words)
            if (word.text.starts_with(line.back())) words.push_back(word.text);
        if (offered.filesBehind) words.push_back(":files" + *offered.filesBehind);
        EXPECT_EQ(fmt::format("{}", fmt::join(words, " ")), row.meaning) << row.line;
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
    std::string help = HelpText(AllCommands(), "");
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
        // The tool's own help has only the short name of an option that has one.
        EXPECT_NE(help.find(names.front()), std::string::npos) << names.front();
        EXPECT_NE(man.find(names.back()), std::string::npos) << names.back();
    }
}

}  // namespace
}  // namespace host
