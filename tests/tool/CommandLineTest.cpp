// corvane-flash as its users meet it: the built tool, run with the built plug-in on simulated
// devices. Every row is one command line or a few; what counts is the exit status and what stands
// on which stream. The same rows are run once more for their JSON lines.

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

#include "tests/tool/CommandLineRow.h"

namespace {

namespace fs = std::filesystem;
using nlohmann::json;

struct Result {
    int status = -1;
    std::string out;
    std::string err;
};

std::string Contents(const fs::path& path) {
    std::ostringstream text;
    text << std::ifstream(path, std::ios::binary).rdbuf();
    return text.str();
}

/// The place where a test's commands run: empty but for a few images, with settings of its own.
class Workplace {
  public:
    Workplace() {
        std::string name = fs::temp_directory_path() / "command-line-test-XXXXXX";
        path_ = mkdtemp(name.data());
        Write("small.hex", ":0400100001020304E2\n:00000001FF\n");  // 01 02 03 04 at 0x10
        Write("other.srec", "S1070010010203FFE3\nS9030000FC\n");   // contradicts small.hex
        Write("far.srec",
              "S30900040000AABB0000"
              "8D\nS70500000000FA\n");  // at 0x40000
        Write("bad.hex", ":0400100001020304E3\n:00000001FF\n");
        Write("data.bin", std::string(300, '\x42'));
        Write("wrong.toml", "FlashTimeoutValue = \"soon\"\n");
        Write("mine.toml", "");
        Write("broken.so", "no library");
    }
    ~Workplace() { fs::remove_all(path_); }
    Workplace(const Workplace&) = delete;
    Workplace& operator=(const Workplace&) = delete;

    fs::path File(const std::string& name) const { return path_ / name; }
    void Write(const std::string& name, const std::string& contents) const {
        std::ofstream(path_ / name, std::ios::binary) << contents;
    }

    /// Runs shell commands in which `tool` is the tool and $ELF, $HEX and $BIN a real firmware.
    Result Run(const std::string& commands) const {
        const std::string script =
            "cd '" + path_.string() +
            "' && exec >.out 2>.err </dev/null\n"
            "export XDG_CONFIG_HOME=\"$PWD/config\" TERM=xterm\n"
            "unset NO_COLOR CORVANE_SIM CORVANE_SIM_FILE CORVANE_GDB CORVANE_PLUGIN\n"
            "ELF='" FIRMWARE_DIRECTORY "/firmware.elf' HEX='" FIRMWARE_DIRECTORY
            "/firmware.ihex'\n"
            "BIN='" FIRMWARE_DIRECTORY
            "/firmware.bin'\n"
            "tool() { \"" CORVANE_FLASH_TOOL "\" \"$@\"; }\n" +
            commands + "\n";
        const int status = std::system(script.c_str());
        return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, Contents(File(".out")),
                Contents(File(".err"))};
    }

  private:
    fs::path path_;
};

/// That a stream holds a part; that it is empty for ""; nothing for null.
void ExpectPart(const std::string& stream, const char* part) {
    if (part == nullptr) return;
    const bool held = *part == '\0' ? stream.empty() : stream.find(part) != std::string::npos;
    EXPECT_TRUE(held) << "not as expected:\n" << stream << "but:\n" << part;
}

TEST_P(CommandLine, AnswersWithItsStatusOnItsStreams) {
    const Row& row = GetParam();
    const Result result = Workplace().Run(row.commands);
    EXPECT_EQ(result.status, row.status) << result.err;
    ExpectPart(result.out, row.out);
    ExpectPart(result.err, row.err);
    const bool explained = ("\n" + result.err).find("\ncorvane-flash: ") != std::string::npos;
    EXPECT_EQ(explained, row.status != 0) << result.err;
}

/// The first "tool" of the commands, or the tool's path, with --json behind it.
std::string WithJson(std::string commands) {
    const std::string name =
        commands.find("timeout -") != std::string::npos ? CORVANE_FLASH_TOOL : "tool";
    return commands.insert(commands.find(name) + name.size(), " --json");
}

TEST_P(CommandLine, TellsTheSameInJsonLines) {
    const Row& row = GetParam();
    const std::string commands = row.commands;
    for (const char* other : {"|", "&", "--help", "--man", "--version"})
        if (commands.find(other) != std::string::npos) return;  // it's not all JSON
    const Result result = Workplace().Run(WithJson(commands));
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

TEST_P(CommandLineStory, EndsAsItShould) {
    const Row& row = GetParam();
    const Result result = Workplace().Run(row.commands);
    EXPECT_EQ(result.status, row.status);
    ExpectPart(result.out, row.out);
    ExpectPart(result.err, row.err);
}

}  // namespace
