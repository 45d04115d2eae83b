// corvane-flash as its users meet it: the built tool, run with the built plug-in on simulated
// devices. The cases stand in tests/tool/lines, a few lines of text each:
//   $ COMMAND    one command line, which is run once more for its JSON lines; or
//   % COMMANDS   several, of which the last one's status counts; either goes on in lines behind
//   = STATUS     0 where it is left out
//   > TEXT       what stands on standard output, and
//   ! TEXT       on standard error: nothing where it is left out
// A text is a part of its stream: whole lines, but for one that ends in "..." there.

#include <gtest/gtest.h>
#include <stdlib.h>
#include <sys/wait.h>

#include <filesystem>
#include <fstream>
#include <map>
#include <nlohmann/json.hpp>
#include <sstream>
#include <string>
#include <vector>

#include "tests/support/TemporaryDirectory.h"

namespace {

using nlohmann::json;

struct Case {
    std::string name;
    bool isStory = false;
    std::string commands;
    int status = 0;
    std::string out;
    std::string err;
};

void PrintTo(const Case& row, std::ostream* stream) {
    *stream << row.commands;
}

void AddCases(const std::filesystem::path& file, std::vector<Case>& cases) {
    std::ifstream lines(file);
    int number = 0;
    for (std::string line; std::getline(lines, line);) {
        ++number;
        if (line.empty() || line[0] == '#') continue;
        const std::string text = line.size() < 2 ? "" : line.substr(2);
        if (line[0] == '$' || line[0] == '%') {
            const std::string name = file.stem().string() + "_" + std::to_string(number);
            cases.push_back({name, line[0] == '%', text, 0, "", ""});
        } else if (line[0] == ' ') {
            cases.back().commands += "\n" + text;
        } else if (line[0] == '=') {
            cases.back().status = std::stoi(text);
        } else if (line[0] == '>' || line[0] == '!') {
            (line[0] == '>' ? cases.back().out : cases.back().err) += text + "\n";
        } else {
            throw std::runtime_error("no line of a case: " + line);
        }
    }
}

std::vector<Case> Cases(bool stories) {
    std::vector<Case> cases;
    for (const auto& entry : std::filesystem::directory_iterator(TESTS_DIRECTORY "/tool/lines"))
        AddCases(entry.path(), cases);
    std::erase_if(cases, [=](const Case& row) { return row.isStory != stories; });
    return cases;
}

struct Result {
    int status = -1;
    std::string out;
    std::string err;
};

/// Runs shell commands in which `tool` is the tool and $ELF, $HEX and $BIN a real firmware, in a
/// directory that is empty but for a few images, with settings of its own.
Result RunShell(const std::string& commands) {
    const test::TemporaryDirectory directory;
    directory.Write("small.hex", ":0400100001020304E2\n:00000001FF\n");  // 01 02 03 04 at 0x10
    directory.Write("other.srec", "S1070010010203FFE3\nS9030000FC\n");   // contradicts small.hex
    directory.Write("far.srec", "S30900040000AABB00008D\nS70500000000FA\n");  // at 0x40000
    directory.Write("bad.hex", ":0400100001020304E3\n:00000001FF\n");
    directory.Write("data.bin", std::string(300, '\x42'));
    directory.Write("wrong.toml", "FlashTimeoutValue = \"soon\"\n");
    directory.Write("mine.toml", "");
    const std::string script =
        "cd '" + directory.Path().string() +
        "' && exec >.out 2>.err </dev/null\n"
        "export XDG_CONFIG_HOME=\"$PWD/config\" TERM=xterm\n"
        "unset NO_COLOR CORVANE_SIM CORVANE_SIM_FILE CORVANE_GDB CORVANE_LOADER CORVANE_PLUGIN\n"
        "export TOOL=\"${CORVANE_TRIED_TOOL:-" CORVANE_FLASH_TOOL
        "}\" TOOLS='" CORVANE_FLASH_DIRECTORY
        "'\n"
        "f='" FIRMWARE_DIRECTORY
        "/firmware'; ELF=$f.elf HEX=$f.ihex BIN=$f.bin\n"
        "tool() { \"$TOOL\" \"$@\"; }\n" +
        commands + "\n";
    const int status = std::system(script.c_str());
    return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, test::Contents(directory.File(".out")),
            test::Contents(directory.File(".err"))};
}

void ExpectPart(const std::string& stream, std::string part) {
    const bool open = part.ends_with("...\n");
    if (open) part.resize(part.size() - 4);
    const bool held =
        part.empty() && !open ? stream.empty() : stream.find(part) != std::string::npos;
    EXPECT_TRUE(held) << "not as expected:\n" << stream << "but:\n" << part;
}

/// Takes out the lines that say which device is worked on, but for rows that are about them.
std::string WithoutTargets(const std::string& text) {
    std::istringstream lines(text);
    std::string rest;
    for (std::string line; std::getline(lines, line);)
        if (!line.starts_with("Simulated ") && !line.starts_with("Board at ")) rest += line + "\n";
    return rest;
}

Result ExpectAnswer(const Case& row) {
    Result result = RunShell(row.commands);
    if (row.err.find(", kept ") == std::string::npos) result.err = WithoutTargets(result.err);
    EXPECT_EQ(result.status, row.status) << result.err;
    ExpectPart(result.out, row.out);
    ExpectPart(result.err, row.err);
    return result;
}

class CommandLine : public testing::TestWithParam<Case> {};

TEST_P(CommandLine, AnswersWithItsStatusOnItsStreams) {
    const Result result = ExpectAnswer(GetParam());
    const bool explained = ("\n" + result.err).find("\ncorvane-flash: ") != std::string::npos;
    EXPECT_EQ(explained, GetParam().status != 0) << result.err;
}

/// The first "tool" of the commands, or the tool's path, with --json behind it.
std::string WithJson(std::string commands) {
    const std::string name = commands.find("timeout -") != std::string::npos ? "$TOOL" : "tool";
    return commands.insert(commands.find(name) + name.size(), " --json");
}

TEST_P(CommandLine, TellsTheSameInJsonLines) {
    const Case& row = GetParam();
    for (const char* other : {"|", "&", "--help", "--man", "--version"})
        if (row.commands.find(other) != std::string::npos) return;  // it's not all JSON
    const Result result = RunShell(WithJson(row.commands));
    EXPECT_EQ(result.status, row.status);
    std::vector<json> lines;
    std::map<std::string, std::uint64_t> done;
    for (std::istringstream stream(result.out); stream.peek() != EOF;) {
        std::string line;
        std::getline(stream, line);
        lines.push_back(json::parse(line));
        EXPECT_EQ(lines.back()["version"], 1);
        if (lines.back()["event"] != "progress") continue;
        std::uint64_t& before = done[lines.back()["phase"]];
        EXPECT_GE(lines.back()["done"], before);
        EXPECT_LE(lines.back()["done"], lines.back()["total"]);
        before = lines.back()["done"];
    }
    ASSERT_FALSE(lines.empty());
    EXPECT_EQ(lines.front()["event"], lines.size() == 1 ? "end" : "begin");
    const json& end = lines.back();
    EXPECT_EQ(end["event"], "end");
    EXPECT_EQ(end["status"], row.status);
    EXPECT_EQ(end["ok"], row.status == 0);
    EXPECT_EQ(end["error"].is_null(), row.status == 0);
}

class CommandLineStory : public testing::TestWithParam<Case> {};

TEST_P(CommandLineStory, EndsAsItShould) {
    ExpectAnswer(GetParam());
}

const auto kName = [](const auto& row) { return row.param.name; };
INSTANTIATE_TEST_SUITE_P(, CommandLine, testing::ValuesIn(Cases(false)), kName);
INSTANTIATE_TEST_SUITE_P(, CommandLineStory, testing::ValuesIn(Cases(true)), kName);

}  // namespace
