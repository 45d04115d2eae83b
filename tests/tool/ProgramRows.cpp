// program, verify and map: images into flash, and what became of them.

#include "tests/tool/CommandLineRow.h"

namespace {

const Row kProgramRows[] = {
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
    {"tool -q program data.bin@400 data.bin@800 - --sim-file d < small.hex && tool -q verify "
     "small.hex data.bin@800 --range 10+7f4 --sim-file d",
     0, "The flash holds the image\n", ""},
    {"tool program small.hex --sim tolva,erase=never", 1, nullptr, "Erasing flash contents timed"},
    {"tool program small.hex --sim tolva,fail-access=30", 1, "",
     "corvane-flash: programming 0x10-0x13: "},
    {"tool program small.hex --sim tolva,loader=dead --set FlashTimeoutValue=1", 1, "",
     "the loader hasn't finished the chunk for 0x0-0x7f within 1 s"},
    {"tool program small.hex --sim mesk,flash=256K --erase all", 1, "",
     "nothing was touched; name its sectors with program --erase 0x0-0x3ffff"},
    {"cp small.hex '[x]'; rm small.hex; tool -q program '[x]'", 0, "", ""},
    {"tool program small.hex --erase some", 2, "", "necessary, none, all or a range A-B"},
    {"tool program small.hex --base 400", 2, "", "and there is none"},
    {"echo > b; tool program data.bin far.srec b --base 400", 2, "", "write FILE@ADDRESS for each"},
    {"tool program data.bin@400 --base 400", 2, "", "data.bin has its address behind the @"},
    {"tool program none@here", 2, "", "there is no file none@here, and 'here' behind its @"},
    {"tool map small.hex --set FlashEraseType='By Address Range' --set FlashEraseEndAddr=ffffffff "
     "--set FlashProgramOption='Use the Erase Options Specified Below'",
     2, "", "0x0 and 0xffffffff, don't lie in the device's flash, 0x0-0x3ffff"},
    {"tool program small.hex@400", 2, "", "no raw binary (ihex)"},
    {"tool verify small.hex --range 20+4", 2, "", "no bytes in the range 0x20-0x23"},
    {"tool program small.hex --base xyz", 2, "", "--base 'xyz' is no hexadecimal number"},
    {"ln -s small.hex l; tool program small.hex --trace l --force", 2, "",
     "the trace can't be written to l: that is an image file of this run, small.hex"},
    {"tool program none.elf", 3, "", "none.elf"},
    {"tool program data.bin", 3, "", "--base"},
    {"tool program /bin/true", 3, "", "program, 64-bit found, a 32-bit little-endian executable"},
    {"for f in /dev/zero -; do yes | tool program $f --base 0 || exit; done", 3, "",
     "/dev/zero: it is larger than 128 MiB, and no image file is"},
    {"truncate -s 1G data.bin; tool program data.bin --base 0", 3, "", "larger than 128 MiB"},
    {"tool program small.hex -- --dry-run", 3, "", "can't read the image file --dry-run: No such"},
    {"tool program bad.hex", 3, "", "bad.hex"},
    {"head -c 3000 $ELF > cut.elf; tool program cut.elf", 3, "", "cut.elf"},
    {"tool program small.hex other.srec", 3, "", "other.srec"},
    {"tool program small.hex far.srec", 3, "", "far.srec: the section 0x40000-0x40003 doesn't"},
    {"tool program small.hex --sim velk", 3, "", "the device has none to program"},
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
    {"tool program small.hex --blank-check --sim tolva,stuck-cell=0x12", 5, "",
     "the flash isn't blank: 0x12 holds 0x00, not 0xff"},
    {"timeout --preserve-status -s INT 1 " CORVANE_FLASH_TOOL
     " program $ELF --sim tolva,loader=hangs",
     130, "", "interrupted; the flash is incomplete: 5 KiB erased"},
    {"mkfifo f; timeout --foreground --preserve-status -s HUP 1 " CORVANE_FLASH_TOOL " program f",
     130, "", "interrupted"},
};

INSTANTIATE_TEST_SUITE_P(Program, CommandLine, testing::ValuesIn(kProgramRows));

// Several runs on one device.
const Row kProgramStories[] = {
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
    {"export CORVANE_SIM_FILE=d; tool -q program small.hex --sim quen\n"
     "tool program data.bin --base 3 --erase all --blank-check --sim quen,fail-access=21",
     1, "", "programming 0x3-0x12e failed: Writing 1 x 4 bytes at 0x400FD000 on page 1"},
    {"export CORVANE_SIM_FILE=d; tool program far.srec --dry-run; tool program small.hex --dry-run "
     "--sim tolva,fail-access=9; tool erase --all --dry-run; ls -d d config",
     2, "would erase", "'config': No such file"},
    {"timeout --foreground -s KILL 1 " CORVANE_FLASH_TOOL
     " program $ELF --sim tolva,loader=hangs --trace t; tail -1 t",
     0, "  host     ", nullptr},
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
};

INSTANTIATE_TEST_SUITE_P(Program, CommandLineStory, testing::ValuesIn(kProgramStories));

}  // namespace
