// The command line itself: help, completion, words that make no sense.

#include "tests/tool/CommandLineRow.h"

namespace {

const Row kLineRows[] = {
    {"tool completion words -- info --sim quen,ram=8K,", 0, "8K,id=\tvalue of the ident", ""},
    {"tool completion words -- --sim=quen,loader=", 0, "--sim=quen,loader=hangs\t\n", ""},
    {"tool completion words -- --set X=1 --set FlashResetSetting=", 0, "Setting=0\treset", ""},
    {"tool completion words -- read --trace=", 0, ":files\t--trace=\n", ""},
    {"tool --help", 0, "Usage: corvane-flash [OPTION]... COMMAND", ""},
    {"tool help | awk 'NR > 23 || length > 79'", 0, "", ""},
    {"tool help mac read", 0, "Usage: corvane-flash mac read\n", ""},
    {"tool help sim", 0, "  quen                  flash=512K,ram=64K,", ""},
    {"tool --man", 0, R"(\fBcorvane\-flash settings\fR [\fIKEY\fR] [\fIOPTION\fR]...)", ""},
    {"tool --version", 0, "corvane-flash 1.", ""},
    {"tool", 2, "", "which command?"},
    {"tool help nonsense", 2, "", "there is no help on 'nonsense'"},
    {"tool porgram small.hex", 2, "",
     "unknown command or option: porgram small.hex; did you mean 'program'?"},
    {"tool program small.hex --dry-run=no", 2, "", "--dry-run takes no value; leave out '=no'"},
    {"tool info --progress fast", 2, "", "--progress can't be 'fast'; it takes auto"},
};

INSTANTIATE_TEST_SUITE_P(Line, CommandLine, testing::ValuesIn(kLineRows));

const Row kLineStories[] = {
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

INSTANTIATE_TEST_SUITE_P(Line, CommandLineStory, testing::ValuesIn(kLineStories));

}  // namespace
