// The settings of the plug-in: listed, kept, named for a run, refused.

#include "tests/tool/CommandLineRow.h"

namespace {

const Row kSettingRows[] = {
    {"tool settings", 0, "FlashTimeoutValue = \"30\"  (default)\n    longest wait", ""},
    {"tool -q settings FlashCrystalFreq", 0, "8\n", ""},
    {"tool --settings mine.toml settings FlashCrystalFreq=10", 0, "\"10\"  (kept value)", ""},
    {"CORVANE_SET_FlashCrystalFreq=c tool settings FlashCrystalFreq=10", 0, "\"c\"  (environment)",
     "the value of the environment goes before it"},
    {"tool info --set FlashTimoutValue=1", 2, "",
     "--set: unknown setting 'FlashTimoutValue'; did you mean 'FlashTimeoutValue'?"},
    {"tool info --set flashtimeoutvalue=1e3", 2, "", "FlashTimeoutValue can't be '1e3'; it takes"},
    {"for n in 0x10 -1 0 1.5 ''; do tool info --set FlashTimeoutValue=$n || exit; done", 2, "",
     "can't be '0x10'"},
    {"tool info --set FlashEraseEndAddr=xyz", 2, "", "FlashEraseEndAddr can't be 'xyz'"},
    {"tool info --set FlashEraseEndAddr", 2, "", "write KEY=TEXT"},
    {"CORVANE_SET_FlashTimeoutValue=x tool info", 2, "", "variable CORVANE_SET_FlashTimeoutValue:"},
    {"tool settings FlashChecksumValue=1", 2, "", "only the plug-in writes it"},
    {"tool settings --forget FlashResetSetting FlashResetSetting=1", 2, "",
     "don't go together; name one"},
    {"tool settings FlashMACAddrInput=021bc3040506", 2, "", "belongs to one board and isn't kept"},
    {"tool --settings /dev/null settings FlashVerboseMode=1", 3, "",
     "/dev/null is no regular file"},
    {"tool info --settings wrong.toml", 3, "", "wrong.toml: line 1: FlashTimeoutValue can't be"},
    {"tool info --settings none.toml", 3, "",
     "can't read the settings file none.toml: No such file"},
};

INSTANTIATE_TEST_SUITE_P(Setting, CommandLine, testing::ValuesIn(kSettingRows));

// Several runs on one device.
const Row kSettingStories[] = {
    {"tool settings FlashVerboseMode=1 >/dev/null; tool -q settings FlashVerboseMode; tool -q "
     "checksum; tool -q settings FlashChecksumValue; tool -q settings --forget flashverbosemode",
     0, "1\n0xb7094978\nb7094978\n0\n", ""},
    {"(unset XDG_CONFIG_HOME HOME; tool -q info >/dev/null && tool settings FlashVerboseMode=1)", 3,
     "", "corvane-flash: no place to keep settings"},
    {"XDG_CONFIG_HOME=/proc/none tool -q blank-check && XDG_CONFIG_HOME=/proc/none tool settings "
     "FlashVerboseMode=1",
     3, "is blank", "can't write the settings file /proc/none"},
    {"mkdir -p config/corvane-flash; set -- d.lock config/corvane-flash/settings.kept.toml.lock\n"
     "flock -F $1 sleep 20 & a=$!; flock -F $2 sleep 20 & b=$!; sleep 0.2\n"
     "tool info --sim-file d & c=$!; tool -q settings FlashVerboseMode=1; echo $?; wait $c; "
     "c=$?; kill $a $b; exit $c",
     4, "3\n", "another run has been using the contents file of the simulated device d for 10 s"},
    {"tool settings | head -1", 0, "FlashProgramOption", ""},
};

INSTANTIATE_TEST_SUITE_P(Setting, CommandLineStory, testing::ValuesIn(kSettingStories));

}  // namespace
