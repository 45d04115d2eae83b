// Ctrl-C, each time in a process of its own: the flag is never taken back.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <thread>

#include "base/system/Signals.h"
#include "host/base/Interrupt.h"
#include "host/files/FileLock.h"
#include "host/files/InputFile.h"
#include "host/files/OutputFile.h"
#include "host/files/Streams.h"
#include "tests/support/FailureOf.h"
#include "tests/support/TemporaryDirectory.h"

namespace host {
namespace {

using namespace std::chrono_literals;
using testing::ExitedWithCode;
using testing::KilledBySignal;

constexpr int kYes = 7;
constexpr int kNo = 8;

[[noreturn]] void Answer(bool yes) {
    _exit(yes ? kYes : kNo);
}

TEST(InterruptDeathTest, IsRememberedOnceAndEndsTheProcessTheSecondTime) {
    for (const int number : {SIGINT, SIGTERM, SIGHUP}) {
        // Signals that come together are one wish.
        EXPECT_EXIT((base::CatchSignals(), raise(number), raise(number), Answer(Interrupted())),
                    ExitedWithCode(kYes), "");
        EXPECT_EXIT((base::CatchSignals(), raise(number), std::this_thread::sleep_for(250ms),
                     raise(number), Answer(true)),
                    KilledBySignal(number), "");
    }
    EXPECT_EXIT(
        (signal(SIGHUP, SIG_IGN), base::CatchSignals(), raise(SIGHUP), Answer(Interrupted())),
        ExitedWithCode(kNo), "");
    EXPECT_EXIT((base::CatchSignals(), raise(SIGPIPE), raise(SIGXFSZ), Answer(Interrupted())),
                ExitedWithCode(kNo), "");
}

TEST(InterruptDeathTest, IsHeldBackWhereAFileWouldBeLeftBehind) {
    const auto hold = [] {
        base::CatchSignals();
        bool held = false;
        {
            const base::SignalsHeld signals;
            raise(SIGTERM);
            held = !Interrupted();
        }
        Answer(held && Interrupted());
    };
    EXPECT_EXIT(hold(), ExitedWithCode(kYes), "");
}

TEST(InterruptDeathTest, EndsEveryWait) {
    constexpr FileKind kNote{"note", ExitStatus::BadFile, 100};
    const test::TemporaryDirectory directory;
    const std::string pipe = directory.File("pipe");
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    const base::Descriptor both(open(pipe.c_str(), O_RDWR | O_NONBLOCK));
    const auto interrupt = [] {
        base::CatchSignals();
        raise(SIGINT);
    };
    const auto endsWith = [&](const auto& wait) {
        interrupt();
        Answer(test::FailureOf(wait) == "130: interrupted");
    };
    EXPECT_EXIT((interrupt(), Answer(!WaitUntilReady(both.Get(), base::Ready::ToRead))),
                ExitedWithCode(kYes), "");
    EXPECT_EXIT((interrupt(), Answer(WriteAll(both.Get(), std::string(100000, 'x')) == EINTR)),
                ExitedWithCode(kYes), "");
    EXPECT_EXIT(endsWith([&] { ReadWholeFile(kNote, pipe); }), ExitedWithCode(kYes), "");
    EXPECT_EXIT(endsWith([&] { OpenForWriting(kNote, pipe); }), ExitedWithCode(kYes), "");
    const FileLock held(kNote, directory.File("file"), [](const std::string&) {});
    EXPECT_EXIT(endsWith([&] {
                    const FileLock second(kNote, directory.File("file"), [](const std::string&) {});
                }),
                ExitedWithCode(kYes), "");
}

}  // namespace
}  // namespace host
