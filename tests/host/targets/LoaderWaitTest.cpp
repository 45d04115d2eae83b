// How the host waits for the loader, on a board that says when it was looked at; and whole program
// loads under virtual time: what they lose, and what they leave alone.

#include <fmt/format.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "host/cli/CommandLine.h"
#include "host/commands/Commands.h"
#include "host/facts/LoaderMemory.h"
#include "host/targets/LoaderWait.h"
#include "target/simulated/Contents.h"
#include "tests/support/VirtualTime.h"

namespace host {
namespace {

using namespace std::chrono_literals;
using std::chrono::nanoseconds;

/// A board whose loader takes its time for each chunk, and which writes down what is done to it.
class Board final : public target::Target, public LoaderObserver {
  public:
    nanoseconds now{0};
    nanoseconds chunkTime{0};
    bool looksStopIt = false;
    bool loseAnswers = false;
    bool interrupted = false;
    std::string log;
    int looks = 0;

    void Read(void* buffer, std::size_t, std::uint32_t address, int, std::size_t) override {
        now += 30us;
        if (address < plugin::kLoaderBuffers) return Note("read");
        ++looks;
        const bool pending = now < ends_.at(address == plugin::kParameterBlocks[1] + 12);
        static_cast<std::uint32_t*>(buffer)[0] = pending ? plugin::kStatusPending : 0;
    }
    void Write(const void*, std::size_t count, std::uint32_t address, int, std::size_t) override {
        if (count == 1) return;  // a status word alone hands nothing over
        now += 30us;
        const std::size_t block = address == plugin::kParameterBlocks[1] + 4;
        ends_.at(block) = std::max(now, ends_.at(1 - block)) + chunkTime;
        if (loseAnswers) throw target::TargetError("lost");
    }
    void LoadProgram(const std::string&, const std::string&) override { Note("load"); }
    void Run() override { Note("run"); }
    void Halt() override { Note("halt"); }
    void Reset(bool) override { Note("reset"); }
    nanoseconds Now() const override { return now; }
    void Pause(std::uint32_t milliseconds) override {
        now += std::chrono::milliseconds(milliseconds);
    }
    bool LooksStopIt() const override { return looksStopIt; }

    void HandingOver(const base::AddressRange&) override { log += "handing "; }
    void HandedOver(const base::AddressRange&) override { log += "handed "; }
    void Programmed(const base::AddressRange& chunk) override { Note(RangeText(chunk).c_str()); }

    /// How long the chunk handed over last is done already; below 0 when it isn't.
    nanoseconds DoneFor() const { return now - std::max(ends_[0], ends_[1]); }

  private:
    void Note(const char* what) {
        log +=
            fmt::format("{}@{} ", what, std::chrono::round<std::chrono::milliseconds>(now).count());
    }

    std::array<nanoseconds, 2> ends_{};
};

struct Rig {
    Board board;
    LoaderWait wait{board, board, [this] { return board.interrupted; }};

    void Start() {
        wait.LoadProgram("loader", "");
        wait.Run();
    }
    void HandOver(std::uint32_t number) {
        const std::uint32_t words[] = {number * 2048, 2048, plugin::kStatusPending};
        wait.Write(words, sizeof words, plugin::kParameterBlocks[number % 2] + 4, 1, 1);
    }
    bool IsPending(std::uint32_t number) {
        std::uint32_t status = 0;
        wait.Read(&status, 1, plugin::kParameterBlocks[number % 2] + 12, 1, 4);
        return status == plugin::kStatusPending;
    }
};

TEST(LoaderWait, FindsEachChunkDoneSoonAndSeldomLooksInVain) {
    for (const bool looksStopIt : {false, true}) {
        for (const auto chunkTime : {200us, 5000us, 12345us, 20000us, 90000us}) {
            Rig rig;
            rig.board.chunkTime = chunkTime;
            rig.board.looksStopIt = looksStopIt;
            rig.Start();
            nanoseconds late{0};
            for (std::uint32_t chunk = 0; chunk < 100; ++chunk) {
                rig.HandOver(chunk);
                EXPECT_FALSE(rig.IsPending(chunk)) << chunk;
                late += rig.board.DoneFor();
            }
            EXPECT_LE(late / 100, 1ms + chunkTime / 16) << chunkTime.count();
            EXPECT_LE(rig.board.looks, looksStopIt ? 220 : 420) << chunkTime.count();
        }
    }
}

TEST(LoaderWait, AwaitsTheLoaderBeforeItIsStopped) {
    Rig rig;
    rig.board.chunkTime = 1500ms;
    rig.wait.Halt();  // nothing was started: the status words are arbitrary
    EXPECT_EQ(rig.board.looks, 0);
    rig.Start();
    rig.HandOver(0);
    EXPECT_TRUE(rig.IsPending(0));  // after the plug-in's interval, and not before
    EXPECT_GE(rig.board.now, 100ms);
    rig.wait.Read(nullptr, 1, 0x40, 0, 1);
    rig.HandOver(1);
    rig.wait.Halt();
    rig.Start();
    rig.board.chunkTime = 31s;
    rig.HandOver(2);
    EXPECT_THROW(rig.wait.Reset(false), target::TargetError);
    rig.wait.Reset(false);
    rig.Start();
    rig.HandOver(3);
    EXPECT_THROW(rig.wait.Halt(), target::TargetError);
    rig.Start();
    rig.board.loseAnswers = true;
    rig.board.chunkTime = 1s;
    EXPECT_THROW(rig.HandOver(4), target::TargetError);
    rig.wait.Halt();  // it was waited for, but nobody knows what the loader got
    rig.board.loseAnswers = false;
    rig.Start();
    rig.HandOver(5);
    rig.board.interrupted = true;
    EXPECT_TRUE(rig.IsPending(5));
    rig.wait.Halt();
    EXPECT_EQ(rig.board.log,
              "halt@0 load@0 run@0 handing handed 0x0-0x7ff@1590 read@1590 handing handed "
              "0x800-0xfff@3179 halt@3179 load@3179 run@3179 handing handed reset@33179 "
              "load@33179 run@33179 handing handed halt@63180 load@63180 run@63180 handing "
              "halt@66361 load@66361 run@66361 handing handed halt@66361 ");
}

std::string Contents(const std::string& path) {
    std::ostringstream text;
    text << std::ifstream(path, std::ios::binary).rdbuf();
    return text.str();
}

std::string TemporaryName(const char* what) {
    return std::filesystem::temp_directory_path() /
           fmt::format("loader-test-{}-{}", getpid(), what);
}

/// corvane-flash program, in this process, with files of its own.
struct Tool {
    Tool() {
        std::filesystem::remove(image);
        std::filesystem::remove(contents);
    }
    ~Tool() {
        std::filesystem::remove(image);
        std::filesystem::remove(contents);
        std::filesystem::remove(trace);
    }

    Outcome Program(const std::string& bytes, const std::string& base,
                    const std::vector<std::string>& more = {}) {
        std::ofstream(image) << bytes;
        Reporter reporter({Verbosity::Quiet, false, "none"});
        SettingStore settings;
        std::vector<std::string> words{"program", image, "--base",   base,
                                       "--sim",   sim,   "--plugin", FLASH_CORVANE_LIBRARY};
        words.insert(words.end(), more.begin(), more.end());
        const ParsedLine line = ParseCommandLine(AllCommands(), FollowLine(AllCommands(), words));
        Context context{line.common, reporter, settings};
        return line.command->run(context, line.given);
    }

    /// The same on a device that stays. How many bytes were erased and written.
    std::pair<int, int> Update(const std::string& bytes, bool rewrite = false) {
        std::vector<std::string> options{"--sim-file", contents, "--trace", trace};
        if (rewrite) options.emplace_back("--rewrite");
        const Outcome outcome = Program(bytes, "0", options);
        EXPECT_EQ(outcome.status, ExitStatus::Done) << outcome.error;
        const auto device =
            target::DecodeContents(Contents(contents), target::ParseDeviceOptions(sim));
        const auto flash = device->FlashContents();
        EXPECT_TRUE(std::equal(bytes.begin(), bytes.end(), flash.begin(),
                               [](char a, std::uint8_t b) { return a == static_cast<char>(b); }));
        counts.clear();
        for (std::size_t page = 0; page < 16; ++page)
            counts += std::to_string(device->Flash().EraseCount(page));
        const Json phases = outcome.result["phases"];
        const auto bytesOf = [&](const char* phase) {
            return phases.contains(phase) ? phases[phase]["bytes"].get<int>() : 0;
        };
        looked = bytesOf("look");
        EXPECT_EQ(bytesOf("verify"), bytes.size());
        return {bytesOf("erase"), bytesOf("program")};
    }

    std::string sim = "quen,flash=32K";
    std::string counts;  ///< how often each of the first pages was erased
    int looked = 0;
    const std::string image = TemporaryName("image");
    const std::string contents = TemporaryName("contents");
    const std::string trace = TemporaryName("trace");
};

TEST(Program, LosesNoChunkHoweverSlowTheLoader) {
    for (const char* chunkTime : {"0", "1ms", "60ms", "100ms", "500ms", "1500ms"}) {
        Tool tool;
        tool.sim = fmt::format("dorna,chunk-time={}", chunkTime);
        const Outcome outcome = tool.Program(std::string(5000, 'x'), "1083");
        EXPECT_EQ(outcome.status, ExitStatus::Done) << chunkTime << outcome.error;
        EXPECT_EQ(outcome.result["phases"]["program"]["bytes"], 5120) << chunkTime;
    }
}

TEST(Program, EndsInBoundedTimeWhenTheLoaderHangs) {
    for (const std::size_t bytes : {100U, 5000U}) {
        Tool tool;
        tool.sim = "dorna,loader=hangs";
        const auto before = test::VirtualNow();
        try {
            tool.Program(std::string(bytes, 'x'), "0");
            ADD_FAILURE() << bytes;
        } catch (const Failure& failure) {
            EXPECT_NE(std::string(failure.what()).find("within 30 s"), std::string::npos)
                << failure.what();
        }
        EXPECT_LE(test::VirtualNow() - before, 60s) << bytes;
    }
}

TEST(Program, LeavesAloneWhatIsThere) {
    using Work = std::pair<int, int>;
    Tool tool;
    std::string image(12 * 1024 - 100, 'x');
    EXPECT_EQ(tool.Update(image), Work(0x3000, 0x3000));
    EXPECT_EQ(tool.looked, 0);  // the samples tell that nothing is there
    EXPECT_EQ(tool.counts, "1111111111110000");

    EXPECT_EQ(tool.Update(image), Work(0, 0));
    EXPECT_EQ(tool.looked, 0x3000);
    EXPECT_EQ(tool.counts, "1111111111110000");
    EXPECT_EQ(Contents(tool.trace).find("LoadProgram"), std::string::npos);

    image[0x7FF] = 'y';
    EXPECT_EQ(tool.Update(image), Work(0x400, 0x400));
    EXPECT_EQ(tool.counts, "1211111111110000");
    image[0x800] = image[0x1000] = image[0x2C00] = 'z';  // one sector between, then six
    EXPECT_EQ(tool.Update(image), Work(0x1000, 0x1000));
    EXPECT_EQ(tool.counts, "1222211111120000");
    EXPECT_EQ(tool.Update(image, true), Work(0x3000, 0x3000));

    image.assign(0x8000, 'w');
    EXPECT_EQ(tool.Update(image), Work(0x8000, 0x8000));  // all at once
    EXPECT_NE(Contents(tool.trace).find("0xa4420004"), std::string::npos);
    image[0] = 'v';
    EXPECT_EQ(tool.Update(image), Work(0x400, 0x400));
}

}  // namespace
}  // namespace host
