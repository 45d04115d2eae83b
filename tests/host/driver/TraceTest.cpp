// The trace: which files it may replace.

#include <gtest/gtest.h>

#include <filesystem>
#include <regex>
#include <utility>

#include "host/driver/Trace.h"
#include "tests/support/FailureOf.h"
#include "tests/support/TemporaryDirectory.h"

namespace host {
namespace {

using test::FailureOf;

/// The lines of a trace without their times.
std::string LinesOf(const std::string& file) {
    return std::regex_replace(test::Contents(file), std::regex("(^|\n) *[0-9]+\\.[0-9]{6}  "),
                              "$1");
}

TEST(Trace, ReplacesATraceAndNothingElseUnasked) {
    const test::TemporaryDirectory directory;
    const std::string file = directory.File("trace");
    const std::string note = directory.Write("note", "mine");
    const std::string beginning =
        "# Trace of corvane-flash " CORVANE_FLASH_VERSION ": seconds, source, event\n";
    { Trace(file, Existing::Keep).Line("host", std::string(1000, 'x')); }
    {
        Trace trace(file, Existing::Keep);
        trace.Line("plug-in", "a line");
        trace.Line("call", "another");
        EXPECT_EQ(trace.Problem(), "");
        EXPECT_EQ(LinesOf(file), beginning + "plug-in  a line\ncall     another\n");
        EXPECT_EQ(FailureOf([&] { Trace(file, Existing::Replace); }),
                  "3: can't write the trace " + file + ": another run is writing it");
    }
    EXPECT_EQ(FailureOf([&] { Trace(note, Existing::Keep); }),
              "2: " + note + " exists; overwrite it with --force");
    EXPECT_EQ(test::Contents(note), "mine");
    { Trace(note, Existing::Replace); }
    EXPECT_EQ(LinesOf(note), beginning);
    EXPECT_EQ(Trace("/dev/full", Existing::Keep).Problem(),
              "the trace /dev/full is incomplete: No space left on device");
}

}  // namespace
}  // namespace host
