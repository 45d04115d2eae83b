// Files that are read, written and locked.

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <future>
#include <thread>

#include "host/files/FileLock.h"
#include "host/files/InputFile.h"
#include "host/files/OutputFile.h"
#include "tests/support/FailureOf.h"
#include "tests/support/TemporaryDirectory.h"

namespace host {
namespace {

namespace fs = std::filesystem;
using test::FailureOf;
using namespace std::chrono_literals;

constexpr FileKind kNote{"note", ExitStatus::BadFile, 100000};

TEST(InputFile, IsReadToItsEndAndNotBeyondItsBound) {
    const test::TemporaryDirectory directory;
    const std::string full(kNote.maxBytes, 'x');
    const std::string file = directory.Write("full", full);
    EXPECT_EQ(ReadWholeFile(kNote, file), full);
    InputFile input(kNote, file);
    EXPECT_EQ(input.Beginning().size(), 65536U);
    EXPECT_EQ(input.Contents(kNote.maxBytes), full);
    EXPECT_EQ(ReadWholeFile(kNote, directory.Write("empty", "")), "");
    EXPECT_EQ(FailureOf([&] { ReadWholeFile(kNote, directory.Write("more", full + "x")); }),
              "3: can't read the note " + directory.File("more") +
                  ": it is larger than 97.7 KiB, and no note is");
    EXPECT_EQ(FailureOf([&] { ReadWholeFile(kNote, "/dev/zero"); }),
              "3: can't read the note /dev/zero: it is larger than 97.7 KiB, and no note is");
    EXPECT_EQ(FailureOf([&] { ReadWholeFile(kNote, directory.Path()); }),
              "3: can't read the note " + directory.Path().string() + ": Is a directory");
}

TEST(InputFile, AwaitsAPipeThatIsWrittenPieceByPiece) {
    const test::TemporaryDirectory directory;
    const std::string pipe = directory.File("pipe");
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    auto reading = std::async(std::launch::async, [&] { return ReadWholeFile(kNote, pipe); });
    {
        const base::Descriptor writer = OpenForWriting(kNote, pipe);
        for (int piece = 0; piece < 3; ++piece) {
            EXPECT_EQ(write(writer.Get(), "abc", 3), 3);
            std::this_thread::sleep_for(5ms);
        }
    }
    EXPECT_EQ(reading.get(), "abcabcabc");
}

TEST(OutputFile, ReplacesTheWholeFileBehindALinkAndKeepsItsPermissions) {
    const test::TemporaryDirectory directory;
    const std::string file = directory.Write("file", "old");
    fs::permissions(file, fs::perms::owner_read | fs::perms::owner_write);
    const std::string link = directory.File("link");
    fs::create_symlink("file", link);
    fs::create_symlink("new", directory.File("dangling"));
    WriteWholeFile(kNote, link, "contents", Existing::Replace);
    WriteWholeFile(kNote, directory.File("dangling"), "made", Existing::Keep);
    EXPECT_EQ(test::Contents(file), "contents");
    EXPECT_EQ(test::Contents(directory.File("new")), "made");
    EXPECT_TRUE(fs::is_symlink(link));
    EXPECT_EQ(fs::status(file).permissions(), fs::perms::owner_read | fs::perms::owner_write);
    const mode_t mask = umask(0);
    umask(mask);
    EXPECT_EQ(fs::status(directory.File("new")).permissions(),
              static_cast<fs::perms>(0666 & ~mask));
    EXPECT_EQ(std::distance(fs::directory_iterator(directory.Path()), {}), 4) << "nothing is left";
    EXPECT_EQ(FailureOf([&] { WriteWholeFile(kNote, "/dev/full", "x", Existing::Keep); }),
              "3: can't write the note /dev/full: No space left on device");
}

TEST(FileLock, KeepsOthersOutUntilItIsGoneAndLeavesNothing) {
    const test::TemporaryDirectory directory;
    const std::string file = directory.File("file");
    fs::create_symlink("file", directory.File("link"));
    std::vector<std::string> said;
    const auto say = [&](const std::string& text) { said.push_back(text); };
    std::future<void> other;
    {
        const FileLock lock(kNote, file, say);
        EXPECT_TRUE(fs::exists(LockPath(file)));
        EXPECT_EQ(LockPath(directory.File("link")), LockPath(file));
        other = std::async(std::launch::async,
                           [&] { const FileLock second(kNote, directory.File("link"), say); });
        EXPECT_EQ(other.wait_for(60ms), std::future_status::timeout);
    }
    other.get();
    EXPECT_EQ(said, (std::vector<std::string>{"another run uses the note " +
                                              directory.File("link") + "; waiting up to 10 s"}));
    EXPECT_FALSE(fs::exists(LockPath(file)));
    // A file of that name which is no lock stays; where none can be made, nothing is locked.
    for (const char* contents : {"", "mine"}) {
        directory.Write("file.lock", contents);
        { const FileLock lock(kNote, file, say); }
        EXPECT_EQ(test::Contents(LockPath(file)), contents);
    }
    { const FileLock lock(kNote, directory.File("none/file"), say); }
    EXPECT_EQ(test::Contents(LockPath(file)), "mine");
    EXPECT_EQ(said.size(), 1U);
}

}  // namespace
}  // namespace host
