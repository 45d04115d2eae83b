// register and mac: the user registers.

#include "tests/tool/CommandLineRow.h"

namespace {

const Row kRegisterRows[] = {
    {"tool register read 1", 0, "0xffffffff\n", ""},
    {"tool register program 1 12ab", 0, "User register 1: was 0xffffffff, is 0x000012ab\n",
     "brings back what was committed last"},
    {"tool mac program 2:1b:c3:4:5:6", 0,
     "MAC address: was ff-ff-ff-ff-ff-ff, is 02-1b-c3-04-05-06\n", "committed last"},
    {"tool --set FlashMACAddrCommit=1 mac program 2:1b:c3:4:5:6", 0, "is 02-1b-c3-04-05-06",
     "FlashMACAddrCommit is 1 (command line)\n"},
    {"tool mac program 03-1b-c3-04-05-06 --force", 0, "is 03-1b-c3-04-05-06", nullptr},
    {"tool mac program --help", 0, "Usage: corvane-flash mac program ADDRESS [OPTION]...", ""},
    {"tool mac program 021bc3040506 --commit --sim quen,fail-access=22", 1, "",
     "; user register 0 holds 0x00c31b02 (committed), user register 1 holds 0x00060504 (perhaps "
     "committed); run"},
    {"tool register program 0 12 --commit --sim quen,fail-from=10", 1, "",
     "user register 0 may have changed and can't be read (not committed), user register 1 is as it "
     "was; the target couldn't be halted; "},
    {"tool mac program 021bc3040506 --sim quen,fail-access=8", 1, "", "registers are as they were"},
    {"tool register read 0 --sim ravik", 1, "", "does not have user reigsters"},
    {"tool mac read -- --json", 2, "", "not expected here: --json; 'corvane"},
    {"tool register program 0 xyz", 2, "", "the value 'xyz' is no hexadecimal number"},
    {"tool mac program 02-1b-c3-04-05", 2, "", "is no MAC address"},
    {"tool mac program 03-1b-c3-04-05-06", 2, "", "is a multicast address"},
};

INSTANTIATE_TEST_SUITE_P(Register, CommandLine, testing::ValuesIn(kRegisterRows));

// Several runs on one device.
const Row kRegisterStories[] = {
    {"export CORVANE_SIM_FILE=d; tool -q mac program 2-1b-c3-4-5-6; tool mac read\n"
     "tool -q mac program 2-1b-c3-4-5-6 --commit; tool mac read; tool register read 0",
     0,
     "MAC address: was ff-ff-ff-ff-ff-ff, is 02-1b-c3-04-05-06\nff-ff-ff-ff-ff-ff\n"
     "MAC address: was ff-ff-ff-ff-ff-ff, is 02-1b-c3-04-05-06\n02-1b-c3-04-05-06\n0x00c31b02\n",
     ""},
    {"tool -q --sim-file a mac program 021bc3040506 --commit; tool -q --sim-file a mac read\n"
     "tool --sim-file b operation ProgramMACAddress",
     2, "02-1b-c3-04-05-06\n02-1b-c3-04-05-06\n", "is all ones"},
};

INSTANTIATE_TEST_SUITE_P(Register, CommandLineStory, testing::ValuesIn(kRegisterStories));

}  // namespace
