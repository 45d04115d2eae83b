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
#include <ostream>
#include <sstream>
#include <string>
#include <vector>

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

struct Row {
    const char* commands;
    int status;
    const char* out;  ///< a part of standard output; "" if it must be empty, null if it may be all
    const char* err;  ///< the same of standard error
};

void PrintTo(const Row& row, std::ostream* stream) {
    *stream << row.commands;
}

// Commands that succeed.
const Row kDone[] = {
    {"tool info", 0,
     "Family      Tolva Rev.B\nId register 0x10010100\nFlash       256 KiB (0x0-0x3ffff)\nSector   "
     "   1 KiB\n"
     "RAM         64 KiB\nOperations  Erase | BlankCheck | ",
     ""},
    {"tool --sim dorna,flash=2M,sector=8K info", 0,
     "Family      Dorna\nId register 0x901a0000\nFlash       2 MiB (0x0-0x1fffff)\nSector      8 "
     "KiB\n",
     ""},
    {"tool info --sim velk", 0, "Flash       none", ""},
    {"CORVANE_SIM=quen tool info", 0, "Family      Quen", ""},
    {"tool program $ELF", 0, "Erased        5 KiB", "4.5 KiB in 1 section for Tolva Rev.B"},
    {"tool -q program $ELF", 0, "", ""},
    {"tool -v program $ELF", 0, nullptr, "erase    0x0-0x13ff"},
    {"tool -vv program $ELF", 0, nullptr, "Erasing Flash Page @ address 0x1000 of size 0x400"},
    {"tool program $ELF --crc", 0, "Checksummed   256 KiB", "CRC-32 value: 0xfe08dea"},
    {"tool program $ELF --blank-check", 0, "Blank-checked 4.5 KiB", "in 1 section"},
    {"tool program $ELF --no-verify", 0, "Done: the image is programmed, but not compared\n",
     nullptr},
    {"tool program data.bin --base 800 --erase all", 0, "Erased        256 KiB", nullptr},
    {"tool program data.bin --base 800 --erase 800-fff", 0, "Erased        2 KiB", nullptr},
    {"tool program data.bin --base 20000 --erase 0-20000 --sim dorna,flash=130K,sector=128K", 0,
     "Erased        130 KiB", nullptr},
    {"tool program small.hex --format ihex --sim mesk", 0, "Written       128 bytes", nullptr},
    {"tool program small.hex --progress plain", 0, "Compared",
     "Programming: 0 % (0 bytes of 128 bytes)\nProgramming: 100 % (128 bytes of 128 bytes)\n"},
    {"tool program small.hex --progress bar", 0, nullptr, "\r\033[KProgramming "},
    {"tool program small.hex --trace -", 0, nullptr, "plug-in  3 FlashCorvane::WriteDataToFlash()"},
    {"tool -q program small.hex --trace t && cat t", 0, "host     LoadProgram \"FlashLoader", ""},
    {"tool program data.bin --base 1083 --sim dorna,chunk-time=100ms", 0, "Written       384 bytes",
     nullptr},
    {"tool -q program $ELF --sim-file d && tool program $ELF --sim-file d", 0,
     "Left alone    4.5 KiB\nDone: the flash held the image already\n", nullptr},
    {"tool -q program $ELF --sim-file d && tool program $ELF --sim-file d --dry-run", 0,
     "erase    nothing\nleave    0x0-0x13ff              5 sectors with the image in place\n",
     nullptr},
    {"tool -q program $ELF --sim-file d && tool program $ELF --sim-file d --rewrite", 0,
     "Erased        5 KiB", nullptr},
    {"tool program small.hex data.bin --base 400 --dry-run --sim-file d && test ! -e d", 0,
     "erase    0x0-0x7ff               2 sectors\nprogram  0x10-0x52b              1.3 KiB\n"
     "304 bytes of the image; 1.7 KiB more are cleared with its sectors; 254 KiB of flash are not "
     "erased\n",
     "in 1 section"},
    {"tool erase --all", 0, "Erased        256 KiB", "Erase covers 0x0-0x3ffff: 256 sectors\n"},
    {"tool erase --all --sim dorna,flash=130K,sector=128K", 0, "Done: 0x0-0x207ff is blank\n",
     "covers 0x0-0x207ff: 2 sectors\n"},
    {"tool erase --range 3ff-400", 0, "Done: 0x0-0x7ff is blank\n",
     "covers 0x0-0x7ff: 2 sectors\n"},
    {"tool erase --range 0-0 --no-verify --sim tolva,stuck-cell=0x12", 0, "nothing was compared\n",
     nullptr},
    {"tool erase --range 0-0 --dry-run", 0,
     "would erase 0x0-0x3ff: 1 sector, 1 KiB; 255 KiB of flash are left as they are\nDry run: "
     "nothing was touched\n",
     ""},
    {"tool -q program data.bin@400 data.bin@800 - --sim-file d < small.hex && tool -q verify "
     "small.hex data.bin@800 --range 10+7f4 --sim-file d",
     0, "The flash holds the image\n", ""},
    {"tool -q blank-check --range 5-5", 0, "0x5-0x5 is blank\n", nullptr},
    {"tool -q checksum", 0, "0xb7094978\n", ""},
    {"tool checksum --range 0-3", 0, "0xffffffff\n", ""},
    {"tool checksum --of $ELF", 0, "0xfe08dea\n", ""},
    {"tool checksum --of small.hex --range 10-13", 0, "0xb63cfbcd\n", ""},
    {"tool register read 1", 0, "0xffffffff\n", ""},
    {"tool register program 1 12ab", 0, "User register 1: was 0xffffffff, is 0x000012ab\n",
     "brings back what was committed last"},
    {"tool mac program 2:1b:c3:4:5:6", 0,
     "MAC address: was ff-ff-ff-ff-ff-ff, is 02-1b-c3-04-05-06\n", "committed last"},
    {"tool --set FlashMACAddrCommit=1 mac program 2:1b:c3:4:5:6", 0, "is 02-1b-c3-04-05-06",
     "FlashMACAddrCommit is 1 (command line)\n"},
    {"tool operation ProgramUserRegister0 --set FlashUserRegister0Input=12", 0,
     "user register 0 holds 0x00000012 (not committed), user register 1 holds 0xffffffff\n",
     nullptr},
    {"tool mac program 03-1b-c3-04-05-06 --force", 0, "is 03-1b-c3-04-05-06", nullptr},
    {"tool operation BlankCheck", 0, "Done: operation BlankCheck\n", "Performing Blank Check...\n"},
    {"tool operation ReadMACAddress", 0, nullptr, "MAC address value: ff-ff-ff-ff-ff-ff"},
    {"tool operation Test", 0, "Done: operation Test\n", ""},
    {"tool settings", 0, "FlashTimeoutValue = \"30\"  (default)\n    longest wait", ""},
    {"tool -q settings FlashCrystalFreq", 0, "8\n", ""},
    {"tool --settings mine.toml settings FlashCrystalFreq=10", 0, "\"10\"  (kept value)", ""},
    {"CORVANE_SET_FlashCrystalFreq=c tool settings FlashCrystalFreq=10", 0, "\"c\"  (environment)",
     "the value of the environment goes before it"},
    {"tool completion words -- ''", 0, "program\tProgram image files", ""},
    {"tool completion words -- -q program --crc -", 0, "--dry-run\t", ""},
    {"tool completion words -- --progress=plain erase ''", 0, "--all\tErase the whole flash\n", ""},
    {"tool completion words -- info --sim quen,ram=8K,", 0, "8K,id=\tvalue of the ident", ""},
    {"tool completion words -- --sim=quen,loader=", 0, "--sim=quen,loader=hangs\t\n", ""},
    {"tool completion words -- operation ''", 0, "\nBlankCheck\t\n", ""},
    {"tool completion words -- register program 1 ''", 0, "--commit\tMake the value", ""},
    {"tool completion words -- help mac ''", 0, "program\tProgram the MAC address\n", ""},
    {"tool completion words -- --set X=1 --set FlashResetSetting=", 0, "Setting=0\treset", ""},
    {"tool completion words -- read --trace=", 0, ":files\t--trace=\n", ""},
    {"tool --help", 0, "Usage: corvane-flash [OPTION]... COMMAND", ""},
    {"tool mac program --help", 0, "Usage: corvane-flash mac program ADDRESS [OPTION]...", ""},
    {"tool help | awk 'NR > 23 || length > 79'", 0, "", ""},
    {"tool help mac read", 0, "Usage: corvane-flash mac read\n", ""},
    {"tool help sim", 0, "  quen                  flash=512K,ram=64K,", ""},
    {"tool --man", 0, R"(\fBcorvane\-flash settings\fR [\fIKEY\fR] [\fIOPTION\fR]...)", ""},
    {"tool --version", 0, "corvane-flash 1.", ""},
};

// Commands that fail: each with its status and one clear line.
const Row kFailing[] = {
    // The device or the plug-in.
    {"tool program small.hex --sim tolva,erase=never", 1, nullptr, "Erasing flash contents timed"},
    {"tool program small.hex --sim tolva,fail-access=30", 1, "",
     "corvane-flash: programming 0x10-0x13: "},
    {"tool program small.hex --sim tolva,loader=dead --set FlashTimeoutValue=1", 1, "",
     "the loader hasn't finished the chunk for 0x0-0x7f within 1 s"},
    {"tool program small.hex --sim mesk,flash=256K --erase all", 1, "",
     "nothing was touched; name its sectors with program --erase 0x0-0x3ffff"},
    {"tool erase --all --sim mesk,flash=256K --dry-run", 1, "", "with --range 0x0-0x3ffff\n"},
    {"tool operation Erase --sim mesk,flash=256K --set FlashEraseType='Entire Flash'", 1, "",
     "Error erasing flash..\n"},
    {"tool erase --all --sim velk", 1, "", "the device (Velk) has no flash"},
    {"tool blank-check --sim tolva,fail-access=9", 1, "",
     "operation BlankCheck failed: Reading 32752 x 1 bytes at 0x0000FFE0 on page 0: "},
    {"tool mac program 021bc3040506 --commit --sim quen,fail-access=22", 1, "",
     "; user register 0 holds 0x00c31b02 (committed), user register 1 holds 0x00060504 (perhaps "
     "committed); run"},
    {"tool register program 0 12 --commit --sim quen,fail-from=10", 1, "",
     "user register 0 may have changed and can't be read (not committed), user register 1 is as it "
     "was; the target couldn't be halted; "},
    {"tool mac program 021bc3040506 --sim quen,fail-access=8", 1, "", "registers are as they were"},
    {"tool register read 0 --sim ravik", 1, "", "does not have user reigsters"},
    {"tool operation BlankChek", 2, "",
     "'BlankChek' is none of the plug-in's operations: Erase | "},
    // The command line.
    {"tool", 2, "", "which command?"},
    {"tool help nonsense", 2, "", "there is no help on 'nonsense'"},
    {"tool porgram small.hex", 2, "",
     "unknown command or option: porgram small.hex; did you mean 'program'?"},
    {"tool mac", 2, "", "mac what? read or program"},
    {"tool info --nonsense", 2, "", "--nonsense; 'corvane-flash info --help'"},
    {"tool info x --qiet y", 2, "", "not expected here: x --qiet y"},
    {"tool mac read -- --json", 2, "", "not expected here: --json; 'corvane"},
    {"tool program --trace -- small.hex", 2, "", "--trace: its value is missing"},
    {"tool --sim-file= info", 2, "", "--sim-file: the name of the file is empty"},
    {"CORVANE_GDB=:1 CORVANE_SIM=quen tool info", 2, "", "with CORVANE_SIM and CORVANE_GDB; unset"},
    {"tool info --qiet", 2, "", "--qiet; did you mean '--quiet'?"},
    {"tool program", 2, "", "FILE is required"},
    {"tool program small.hex --erase some", 2, "", "necessary, none, all or a range A-B"},
    {"tool program small.hex --base 400", 2, "", "and there is none"},
    {"echo > b; tool program data.bin far.srec b --base 400", 2, "", "write FILE@ADDRESS for each"},
    {"tool program data.bin@400 --base 400", 2, "", "data.bin has its address behind the @"},
    {"tool program none@here", 2, "", "there is no file none@here, and 'here' behind its @"},
    {"tool checksum --format bin", 2, "", "and none is named"},
    {"tool map small.hex --set FlashEraseType='By Address Range' --set FlashEraseEndAddr=ffffffff "
     "--set FlashProgramOption='Use the Erase Options Specified Below'",
     2, "", "0x0 and 0xffffffff, don't lie in the device's flash, 0x0-0x3ffff"},
    {"tool program small.hex@400", 2, "", "no raw binary (ihex)"},
    {"tool verify small.hex --range 20+4", 2, "", "no bytes in the range 0x20-0x23"},
    {"tool erase --range 20+0", 2, "", "the range '20+0' has no bytes"},
    {"tool program small.hex --base xyz", 2, "", "--base 'xyz' is no hexadecimal number"},
    {"tool info --progress fast", 2, "", "--progress can't be 'fast'; it takes auto"},
    {"tool info --sim tovla", 2, "", "did you mean 'tolva'?"},
    {"tool info --sim tolva,colour=red", 2, "", "colour"},
    {"tool info --set FlashTimoutValue=1", 2, "",
     "--set: unknown setting 'FlashTimoutValue'; did you mean 'FlashTimeoutValue'?"},
    {"tool info --set flashtimeoutvalue=1e3", 2, "", "FlashTimeoutValue can't be '1e3'; it takes"},
    {"for n in 0x10 -1 0 1.5 ''; do tool info --set FlashTimeoutValue=$n || exit; done", 2, "",
     "can't be '0x10'"},
    {"tool info --set FlashEraseEndAddr=xyz", 2, "", "FlashEraseEndAddr can't be 'xyz'"},
    {"tool info --set FlashEraseEndAddr", 2, "", "write KEY=TEXT"},
    {"CORVANE_SET_FlashTimeoutValue=x tool info", 2, "", "variable CORVANE_SET_FlashTimeoutValue:"},
    {"tool settings FlashChecksumValue=1", 2, "", "only the plug-in writes it"},
    {"tool erase", 2, "", "erase what? --all"},
    {"tool erase --all --range 0-1", 2, "", "not both"},
    {"tool erase --range ''", 2, "", "'' is no address range"},
    {"tool blank-check --range 0-40000", 2, "", "doesn't lie in the device's flash, 0x0-0x3ffff"},
    {"tool read small.hex", 2, "", "small.hex exists; overwrite it with --force"},
    {"ln -s small.hex l; tool program small.hex --trace l --force", 2, "",
     "the trace can't be written to l: that is an image file of this run, small.hex"},
    {"tool --sim-file new read ./new", 2, "", "that is the device file of this run, new"},
    {"tool info --trace data.bin", 2, "", "data.bin exists; overwrite it with --force"},
    {"tool read - --json", 2, nullptr, "both want standard output"},
    {"tool read flash.elf", 2, "", "name a .bin, .hex or .srec file"},
    {"tool register program 0 xyz", 2, "", "the value 'xyz' is no hexadecimal number"},
    {"tool register read 2", 2, "", "INDEX can't be '2'; it takes 0 or 1"},
    {"tool mac program 02-1b-c3-04-05", 2, "", "is no MAC address"},
    {"tool mac program 03-1b-c3-04-05-06", 2, "", "is a multicast address"},
    {"tool operation ProgramMACAddress", 2, "", "is all ones"},
    {"tool operation ProgramUserRegister1", 2, "", "set FlashUserRegister1Input with --set"},
    {"tool settings --forget FlashResetSetting FlashResetSetting=1", 2, "", "are two wishes"},
    {"tool settings FlashMACAddrInput=021bc3040506", 2, "", "belongs to one board and isn't kept"},
    // Files.
    {"tool program none.elf", 3, "", "none.elf"},
    {"tool program data.bin", 3, "", "--base"},
    {"tool program /bin/true", 3, "", "program, 64-bit found, a 32-bit little-endian executable"},
    {"for f in /dev/zero -; do yes | tool program $f --base 0 || exit; done", 3, "",
     "/dev/zero: it is larger than 128 MiB, and no image file is"},
    {"truncate -s 1G data.bin; tool program data.bin --base 0", 3, "", "larger than 128 MiB"},
    {"tool program small.hex -- --dry-run", 3, "", "can't read the image file --dry-run: No such"},
    {"tool --settings /dev/null settings FlashVerboseMode=1", 3, "",
     "/dev/null is no regular file"},
    {"tool program bad.hex", 3, "", "bad.hex"},
    {"head -c 3000 $ELF > cut.elf; tool program cut.elf", 3, "", "cut.elf"},
    {"tool program small.hex other.srec", 3, "", "other.srec"},
    {"tool program small.hex far.srec", 3, "", "far.srec: the section 0x40000-0x40003 doesn't"},
    {"tool program small.hex --sim velk", 3, "", "the device has none to program"},
    {"tool info --settings wrong.toml", 3, "", "wrong.toml: line 1: FlashTimeoutValue can't be"},
    {"tool info --settings none.toml", 3, "",
     "can't read the settings file none.toml: No such file"},
    {"tool read none/flash.bin", 3, "", "can't write the image file none/flash.bin: No such file"},
    {"tool info --trace /dev/full", 3, nullptr, "the trace /dev/full is incomplete: No space left"},
    {"chmod a-w data.bin; tool read data.bin --force", 3, "", "data.bin: it is read-only"},
    {"tool info --trace none/t", 3, "", "can't write the trace none/t: No such file"},
    // Plug-in and target.
    {"tool info --plugin none.so", 4, "", "none.so: cannot open shared object file"},
    {"tool info --plugin broken.so", 4, "", "broken.so"},
    {"head -c 9000 " CORVANE_FLASH_DIRECTORY
     "/../lib/libflash_corvane.so > cut.so; tool info --plugin cut.so",
     4, "", "./cut.so is cut short"},
    {"mkfifo pipe; tool info --plugin pipe", 4, "", "./pipe is no regular file"},
    {"tool info --plugin $(ldconfig -p | sed -n 's/.* //; /libz\\.so\\.1$/p' | head -1)", 4, "",
     "is no flash plug-in: it exports no CreateFlashDevice2"},
    {"tool info --sim-file data.bin", 4, "", "data.bin"},
    {"tool info --sim tolva,fail-access=2", 4, "",
     "can't reach the target: identifying the device"},
    {"tool erase --all --sim tolva,registers=zeros", 4, "", "nothing answers: "},
    {"tool info --sim tolva,registers=ones", 4, "", "register reads 0xffffffff"},
    // Flash that isn't as it should be.
    {"tool verify small.hex", 5, "Compared      4 bytes",
     "the flash differs from small.hex: 4 bytes in 1 range\n"
     "  0x10-0x13               small.hex: first expected 0x01, actual 0xff\n"},
    {"tool verify small.hex data.bin --base 40", 5, nullptr,
     "the flash differs from the images: 304 bytes in 2 ranges\n"
     "  0x10-0x13               small.hex: first expected 0x01, actual 0xff\n"
     "  0x40-0x16b              data.bin: first expected 0x42, actual 0xff\n"},
    {"tool program small.hex --sim tolva,stuck-cell=0x12", 5, "Written",
     "1 byte in 1 range; some bits stay 0 although their sectors were erased: "},
    {"tool program small.hex --erase 0-0 --sim tolva,stuck-cell=0x12", 5, "Written",
     "some bits stay 0 although their sectors were erased: "},
    {"tool erase --range 0-0 --sim tolva,stuck-cell=0x12", 5, "Erased        1 KiB",
     "reported the erase done: 0x12 holds 0x00, not 0xff; 1 byte in 1 range not blank; the cells"},
    {"tool operation Erase --sim tolva,stuck-cell=0x12", 5, "Compared      1 KiB", "not blank"},
    {"tool program small.hex --blank-check --sim tolva,stuck-cell=0x12", 5, "",
     "the flash isn't blank: 0x12 holds 0x00, not 0xff"},
    {"tool blank-check --sim tolva,stuck-cell=0x1234", 5, "", "0x1234 holds 0x00"},
    // Ctrl-C; timeout interrupts the command, and then its whole group.
    {"timeout --preserve-status -s INT 1 " CORVANE_FLASH_TOOL
     " program $ELF --sim tolva,loader=hangs",
     130, "", "interrupted; the flash is incomplete: 5 KiB erased"},
    {"mkfifo f; timeout --foreground --preserve-status -s HUP 1 " CORVANE_FLASH_TOOL " program f",
     130, "", "interrupted"},
};

/// That a stream holds a part; that it is empty for ""; nothing for null.
void ExpectPart(const std::string& stream, const char* part) {
    if (part == nullptr) return;
    const bool held = *part == '\0' ? stream.empty() : stream.find(part) != std::string::npos;
    EXPECT_TRUE(held) << "not as expected:\n" << stream << "but:\n" << part;
}

class CommandLine : public testing::TestWithParam<Row> {};

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

INSTANTIATE_TEST_SUITE_P(Done, CommandLine, testing::ValuesIn(kDone));
INSTANTIATE_TEST_SUITE_P(Failing, CommandLine, testing::ValuesIn(kFailing));

// Several runs on one device.
const Row kStories[] = {
    {"for f in $ELF $HEX '--base 0 '$BIN; do rm -f d; tool -q --sim-file d program $f;\n"
     "tool -q --sim-file d checksum; done",
     0, "0xfe08dea\n0xfe08dea\n0xfe08dea\n", ""},
    {"export CORVANE_SIM_FILE=d; tool -q program $ELF\n"
     "for f in a.bin a.hex a.srec; do tool -q read $f; done\n"
     "for f in a.bin@0 a.hex a.srec; do tool -q verify $f; done\n"
     "tool -q read p.bin --range 10-1f && cmp -n 16 -i 0:16 p.bin a.bin && wc -c < p.bin",
     0, "The flash holds the image\nThe flash holds the image\nThe flash holds the image\n16\n",
     ""},
    {"export CORVANE_SIM_FILE=d; tool -q program small.hex; tool -q program data.bin --base 400\n"
     "tool -q verify small.hex; tool -q erase --range 400-7ff; tool -q blank-check --range "
     "400-7ff\n"
     "tool -q program data.bin --base 10 --erase none",
     5, "The flash holds the image\n0x400-0x7ff is blank\n", "bits were not erased"},
    {"export CORVANE_SIM_FILE=d; tool -q mac program 2-1b-c3-4-5-6; tool mac read\n"
     "tool -q mac program 2-1b-c3-4-5-6 --commit; tool mac read; tool register read 0",
     0,
     "MAC address: was ff-ff-ff-ff-ff-ff, is 02-1b-c3-04-05-06\nff-ff-ff-ff-ff-ff\n"
     "MAC address: was ff-ff-ff-ff-ff-ff, is 02-1b-c3-04-05-06\n02-1b-c3-04-05-06\n0x00c31b02\n",
     ""},
    {"tool -q --sim-file a mac program 021bc3040506 --commit; tool -q --sim-file a mac read\n"
     "tool --sim-file b operation ProgramMACAddress",
     2, "02-1b-c3-04-05-06\n02-1b-c3-04-05-06\n", "is all ones"},
    {"tool -q --sim quen,flash=512K --sim-file d program small.hex; tool -q --sim-file d info | "
     "head -1; tool --sim-file d --sim quen,flash=256K info",
     2, "Family      Quen\n", "flash"},
    {"export CORVANE_SIM_FILE=d; tool -q program small.hex --sim tolva; tool -q erase --all "
     "--sim tolva,fail-from=40; tool -q blank-check",
     5, "", "isn't blank: 0x10 holds 0x01"},
    {"export CORVANE_SIM_FILE=d; tool -q program small.hex; tool -q program data.bin --base 10 "
     "--sim "
     "tolva,fail-access=50; tool -q blank-check --range 0-3ff",
     0, "0x0-0x3ff is blank", "the flash is incomplete: 1 KiB erased"},
    {"tool settings FlashVerboseMode=1 >/dev/null; tool -q settings FlashVerboseMode; tool -q "
     "checksum; tool -q settings FlashChecksumValue; tool -q settings --forget flashverbosemode",
     0, "1\n0xb7094978\nb7094978\n0\n", ""},
    {"(unset XDG_CONFIG_HOME HOME; tool -q info >/dev/null && tool settings FlashVerboseMode=1)", 3,
     "", "corvane-flash: no place to keep settings"},
    {"XDG_CONFIG_HOME=/proc/none tool -q blank-check && XDG_CONFIG_HOME=/proc/none tool settings "
     "FlashVerboseMode=1",
     3, "is blank", "can't write the settings file /proc/none"},
    {"export CORVANE_SIM_FILE=d; tool -q program small.hex --sim quen\n"
     "tool program data.bin --base 3 --erase all --blank-check --sim quen,fail-access=21",
     1, "", "programming 0x3-0x12e failed: Writing 1 x 4 bytes at 0x400FD000 on page 1"},
    {"export CORVANE_SIM_FILE=d; echo mine >d.lock; tool info >&2; cat d.lock; tool read d.lock "
     "--force",
     2, "mine\n", "that is the lock of the device file of this run"},
    {"tool --json info --trace /dev/full --sim-file none/d --sim tolva,fail-access=9", 4,
     "\"from\":\"host\",\"level\":\"error\",\"text\":\"", nullptr},
    {"for o in ReadMACAddress ReadUserRegister1 CalculateChecksum; do tool --json -q operation $o "
     "|\n"
     "grep -E 'mac.:.ff-ff-ff|register.:1,.value.:4294967295|checksum.:.0xb7094978'; done | wc -l",
     0, "3\n", ""},
    {"tool read a.bin; ln a.bin old; tool -q read a.bin --force --range 0-f && wc -c < a.bin; wc "
     "-c "
     "< old",
     0, "16\n262144\n", nullptr},
    {"ln -s a.bin l; tool -q read l --range 0-f && tool -q read l --range 0-1f --force\n"
     "test -L l && wc -c < a.bin; chmod a-w a.bin; tool -q read l --force",
     3, "32\n", "can't write the image file l: it is read-only"},
    {"export CORVANE_SIM_FILE=d; tool program far.srec --dry-run; tool program small.hex --dry-run "
     "--sim tolva,fail-access=9; tool erase --all --dry-run; ls -d d config",
     2, "would erase", "'config': No such file"},
    {"(ulimit -f 8; tool -q read x --trace t); echo $? x*", 0, "3 x*\n", "File too large"},
    {"timeout --foreground -s KILL 1 " CORVANE_FLASH_TOOL
     " program $ELF --sim tolva,loader=hangs --trace t; tail -1 t",
     0, "  host     ", nullptr},
    {"tool info --trace t >&- 2>&-; head -1 t; echo $?; tool -q info --trace t; tool --help >&-", 3,
     "# Trace of corvane-flash ", "can't write to standard output: Bad file descriptor"},
    // Eight at once: each waits for its turn, and nothing gets lost.
    {"export CORVANE_SIM_FILE=d; n=0\n"
     "for key in EraseStart EraseEnd BlankCheckStart BlankCheckEnd ChecksumStart ChecksumEnd; do\n"
     "n=$((n + 1)); tool -q program data.bin --base ${n}000 & tool -q settings Flash${key}Addr=$n &"
     "\ndone; tool -q mac program 0-1-2-3-4-5 --commit & tool -q settings FlashCrystalFreq=c & "
     "wait\n"
     "for n in 1 2 3 4 5 6; do tool -q verify data.bin --base ${n}000; done; tool -q mac read\n"
     "cat config/*/settings.kept.toml | grep -c 'Addr = .[1-6]\\|CrystalFreq = .c'; ls -d *.*",
     0,
     "image\nThe flash holds the image\nThe flash holds the image\n00-01-02-03-04-05\n7\nbad.hex",
     nullptr},
    {"mkdir -p config/corvane-flash; set -- d.lock config/corvane-flash/settings.kept.toml.lock\n"
     "flock -F $1 sleep 20 & a=$!; flock -F $2 sleep 20 & b=$!; sleep 0.2\n"
     "tool info --sim-file d & c=$!; tool -q settings FlashVerboseMode=1; echo $?; wait $c; "
     "c=$?; kill $a $b; exit $c",
     4, "3\n", "another run has been using the contents file of the simulated device d for 10 s"},
    {"tool info > /dev/full", 3, "", "can't write to standard output: No space left on device"},
    {"tool settings | head -1", 0, "FlashProgramOption", ""},
    // A map: what is there, what an image would change; and what is kept.
    {"export CORVANE_SIM_FILE=d; tool -q program small.hex --sim mesk,flash=16K; tool -q map\n"
     "tool -q program data.bin --base 200 --dry-run | tail -6\n"
     "tool -q program data.bin --base 200 --keep; tool -q verify small.hex; tool -q map",
     0,
     "0x0000  #...............\nA character is a sector of 1 KiB\n  . blank                  15 "
     "KiB\n"
     "  # in use                 1 KiB\n"
     "0x0000  x...............\nA character is a sector of 1 KiB\n  . blank                  15.2 "
     "KiB\n"
     "  + to be programmed       300 bytes\n  x cleared along with it  512 bytes\n"
     "Dry run: nothing was touched\nThe flash holds the image\n0x0000  #....",
     ""},
    {"tool --json map small.hex | tail -1", 0,
     "\"runs\":[{\"address\":0,\"bytes\":16,\"state\":\"blank\"},{\"address\":16,\"bytes\":4,"
     "\"state\":\"program\"},{\"address\":20,\"bytes\":262124,\"state\":\"blank\"}]",
     nullptr},
    {"tool program small.hex --keep --erase all", 2, "", "--keep goes with --erase necessary"},
    {"timeout --foreground -s INT 1 " CORVANE_FLASH_TOOL
     " --json -q program $ELF --sim tolva,loader=hangs | sed -n '$p'",
     0, R"("clearedBytes":552,"keptBytes":0,"flashChanged":true,"phases":{"erase")", nullptr},
    // What the shells make of it: bash has taken the word apart, zsh would show what is added.
    {"tool --settings wrong.toml completion bash >c; PATH=" CORVANE_FLASH_DIRECTORY
     ":$PATH bash -c '. "
     "./c; COMP_LINE=\"corvane-flash program --erase=n\" COMP_POINT=31 COMP_CWORD=4 "
     "COMP_WORDS=(corvane-flash program --erase = n); _corvane_flash; echo \"${COMPREPLY[@]}\"'",
     0, "necessary none\n", ""},
    {"tool completion zsh >c; zsh -fc 'compdef() { }; compadd() { print -r -- $closed }; . ./c; "
     "words=(" CORVANE_FLASH_TOOL
     " program --erase=) CURRENT=3 PREFIX=--erase=; _corvane-flash'; :",
     0, "--erase=necessary --erase=none --erase=all\n", nullptr},
    {"tool completion fish >c; fish -c '. ./c; complete -C \"" CORVANE_FLASH_TOOL
     " verify --format=s\"'",
     0, "--format=srec\n", ""},
};

class CommandLineStory : public testing::TestWithParam<Row> {};

TEST_P(CommandLineStory, EndsAsItShould) {
    const Row& row = GetParam();
    const Result result = Workplace().Run(row.commands);
    EXPECT_EQ(result.status, row.status);
    ExpectPart(result.out, row.out);
    ExpectPart(result.err, row.err);
}

INSTANTIATE_TEST_SUITE_P(Runs, CommandLineStory, testing::ValuesIn(kStories));

}  // namespace
