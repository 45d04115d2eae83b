// read, erase, blank-check, checksum, and operations by their names.

#include "tests/tool/CommandLineRow.h"

namespace {

const Row kFlashRows[] = {
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
    {"tool -q blank-check --range 5-5", 0, "0x5-0x5 is blank\n", nullptr},
    {"tool -q checksum", 0, "0xb7094978\n", ""},
    {"tool checksum --range 0-3", 0, "0xffffffff\n", ""},
    {"tool checksum --of $ELF", 0, "0xfe08dea\n", ""},
    {"tool checksum --of small.hex --range 10-13", 0, "0xb63cfbcd\n", ""},
    {"tool operation ProgramUserRegister0 --set FlashUserRegister0Input=12", 0,
     "user register 0 holds 0x00000012 (not committed), user register 1 holds 0xffffffff\n",
     nullptr},
    {"tool operation BlankCheck", 0, "Done: operation BlankCheck\n", "Performing Blank Check...\n"},
    {"tool operation ReadMACAddress", 0, nullptr, "MAC address value: ff-ff-ff-ff-ff-ff"},
    {"tool operation Test", 0, "Done: operation Test\n", ""},
    {"tool erase --all --sim mesk,flash=256K --dry-run", 1, "", "with --range 0x0-0x3ffff\n"},
    {"tool operation Erase --sim mesk,flash=256K --set FlashEraseType='Entire Flash'", 1, "",
     "Error erasing flash..\n"},
    {"tool erase --all --sim velk", 1, "", "the device (Velk) has no flash"},
    {"tool blank-check --sim tolva,fail-access=9", 1, "",
     "operation BlankCheck failed: Reading 32752 x 1 bytes at 0x0000FFE0 on page 0: "},
    {"tool operation BlankChek", 2, "",
     "'BlankChek' is none of the plug-in's operations: Erase | "},
    {"tool checksum --format bin", 2, "", "and none is named"},
    {"tool erase --range 20+0", 2, "", "the range '20+0' has no bytes"},
    {"tool erase", 2, "", "erase what? --all"},
    {"tool erase --all --range 0-1", 2, "", "not both"},
    {"tool erase --range ''", 2, "", "'' is no address range"},
    {"tool blank-check --range 0-40000", 2, "", "doesn't lie in the device's flash, 0x0-0x3ffff"},
    {"tool read small.hex", 2, "", "small.hex exists; overwrite it with --force"},
    {"tool --sim-file new read ./new", 2, "", "that is the device file of this run, new"},
    {"tool read - --json", 2, nullptr, "both want standard output"},
    {"tool read flash.elf", 2, "", "name a .bin, .hex or .srec file"},
    {"tool operation ProgramMACAddress", 2, "", "is all ones"},
    {"tool operation ProgramUserRegister1", 2, "", "set FlashUserRegister1Input with --set"},
    {"tool read none/flash.bin", 3, "", "can't write the image file none/flash.bin: No such file"},
    {"chmod a-w data.bin; tool read data.bin --force", 3, "", "data.bin: it is read-only"},
    {"tool erase --all --sim tolva,registers=zeros", 4, "", "nothing answers: "},
    {"tool erase --range 0-0 --sim tolva,stuck-cell=0x12", 5, "Erased        1 KiB",
     "reported the erase done: 0x12 holds 0x00, not 0xff; 1 byte in 1 range not blank; the cells"},
    {"tool operation Erase --sim tolva,stuck-cell=0x12", 5, "Compared      1 KiB", "not blank"},
    {"tool blank-check --sim tolva,stuck-cell=0x1234", 5, "", "0x1234 holds 0x00"},
};

INSTANTIATE_TEST_SUITE_P(Flash, CommandLine, testing::ValuesIn(kFlashRows));

// Several runs on one device.
const Row kFlashStories[] = {
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
    {"(ulimit -f 8; tool -q read x --trace t); echo $? x*", 0, "3 x*\n", "File too large"},
};

INSTANTIATE_TEST_SUITE_P(Flash, CommandLineStory, testing::ValuesIn(kFlashStories));

}  // namespace
