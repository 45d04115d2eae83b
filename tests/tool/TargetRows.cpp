// Which target, through which plug-in, traced where: what every command can be told, tried with
// `info`.

#include "tests/tool/CommandLineRow.h"

namespace {

const Row kTargetRows[] = {
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
    {"CORVANE_GDB=:1 CORVANE_SIM=quen tool info", 2, "", "with CORVANE_SIM and CORVANE_GDB; unset"},
    {"tool info --sim tovla", 2, "", "did you mean 'tolva'?"},
    {"tool info --sim tolva,colour=red", 2, "", "colour"},
    {"tool info --trace data.bin", 2, "", "data.bin exists; overwrite it with --force"},
    {"tool info --trace /dev/full", 3, nullptr, "the trace /dev/full is incomplete: No space left"},
    {"tool info --trace none/t", 3, "", "can't write the trace none/t: No such file"},
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
    {"tool info --sim tolva,registers=ones", 4, "", "register reads 0xffffffff"},
};

INSTANTIATE_TEST_SUITE_P(Target, CommandLine, testing::ValuesIn(kTargetRows));

// Several runs on one device.
const Row kTargetStories[] = {
    {"export CORVANE_SIM_FILE=d; echo mine >d.lock; tool info >&2; cat d.lock; tool read d.lock "
     "--force",
     2, "mine\n", "that is the lock of the device file of this run"},
    {"tool --json info --trace /dev/full --sim-file none/d --sim tolva,fail-access=9", 4,
     "\"from\":\"host\",\"level\":\"error\",\"text\":\"", nullptr},
    {"tool info --trace t >&- 2>&-; head -1 t; echo $?; tool -q info --trace t; tool --help >&-", 3,
     "# Trace of corvane-flash ", "can't write to standard output: Bad file descriptor"},
    {"tool info > /dev/full", 3, "", "can't write to standard output: No space left on device"},
};

INSTANTIATE_TEST_SUITE_P(Target, CommandLineStory, testing::ValuesIn(kTargetStories));

}  // namespace
