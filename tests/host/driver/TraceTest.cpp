// The trace: which files it may replace, and a line for each slot.

#include <gtest/gtest.h>

#include <filesystem>
#include <regex>
#include <utility>

#include "host/driver/TracingHost.h"
#include "host/facts/LoaderMemory.h"
#include "tests/host/driver/HostUnderTest.h"
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

TEST(TracingHost, WritesEverySlotWithItsAnswer) {
    const test::TemporaryDirectory directory;
    const std::string file = directory.File("trace");
    {
        Trace trace(file, Existing::Keep);
        HostUnderTest test("tolva,fail-access=3");
        TracingHost host(test.host, trace);
        std::uint8_t bytes[8] = {};
        const std::uint16_t half = 0x1234;
        host.GetProperty("FlashTimeoutValue");
        host.GetProperty("FlashNonsense");
        host.SetProperty("Key", "text");
        host.HaltTarget();
        host.ReadMemory(bytes, 8, 0x100, 0, 1);
        host.WriteMemory(&half, 1, 0x20000000, 1, 2);
        host.ReadMemory(bytes, 1, 0x100, 0, 1);
        host.BeginProgress("Title");
        host.UpdateProgress(50, "half");
        host.EndProgress();
        testing::internal::CaptureStderr();
        host.ShowError("an error");
        host.ShowMessage("a message");
        testing::internal::GetCapturedStderr();
        host.GetDirectory();
        host.Sleep(3);
        host.ResetTarget(true);
        host.LoadProgram(plugin::kLoaderFile, "", plugin::kLoaderSubdirectory);
        host.RunTarget();
    }
    const std::string lines = LinesOf(file);
    EXPECT_EQ(lines.substr(lines.find('\n') + 1), R"(host     GetProperty FlashTimeoutValue = "30"
host     GetProperty FlashNonsense -> unknown
host     SetProperty Key = "text"
host     HaltTarget
host     ReadMemory 0x00000100, 8 x 1, page 0 = 8 bytes
host     WriteMemory 0x20000000, 1 x 2, page 1 = 0x1234 -> error: Writing 1 x 2 bytes at 0x20000000 on page 1: the connection to the target failed at access 3 [fail-access]
host     ReadMemory 0x00000100, 1 x 1, page 0 = 0xff
host     BeginProgress "Title"
host     UpdateProgress 50 %, "half"
host     EndProgress
host     ShowError "an error"
host     ShowMessage "a message"
host     GetDirectory = "dir/"
host     Sleep 3 ms
host     ResetTarget true
host     LoadProgram "FlashLoaderMerrow.out", "", "..\..\merrow\"
host     RunTarget
)");
}

}  // namespace
}  // namespace host
