// How the host waits for the loader, on a board that says when it was looked at.

#include <fmt/format.h>
#include <gtest/gtest.h>

#include <functional>
#include <random>

#include "host/facts/LoaderMemory.h"
#include "host/targets/LoaderWait.h"

namespace host {
namespace {

using namespace std::chrono_literals;
using std::chrono::nanoseconds;

/// A board whose loader takes its time for each chunk, and which writes down what is done to it.
/// Each access is an exchange. Where looks stop it, one more stops it; it goes on in a pause, or
/// when a chunk was found pending, and another look at it as it stands still is free.
class Board final : public target::Target, public LoaderObserver {
  public:
    nanoseconds now{0};
    nanoseconds exchange{30us};
    std::function<nanoseconds()> chunkTime = [] { return 0ns; };
    bool stopsForReads = false;
    bool loseAnswers = false;
    bool interrupted = false;
    std::string log;
    int looks = 0;
    int stops = 0;
    int packets = 0;

    void Read(void* buffer, std::size_t, std::uint32_t address, int, std::size_t) override {
        Stop();
        if (!looked_ || !still_) Exchange();
        if (address < plugin::kLoaderBuffers) return Note("read");
        ++looks;
        looked_ = true;
        const bool pending = RanFor() < ends_.at(address == plugin::kParameterBlocks[1] + 12);
        static_cast<std::uint32_t*>(buffer)[0] = pending ? plugin::kStatusPending : 0;
        if (pending) GoOn();
    }
    void Write(const void*, std::size_t count, std::uint32_t address, int, std::size_t) override {
        if (count == 1) return;  // a status word alone hands nothing over
        Stop();
        Exchange();
        if (address < plugin::kParameterBlocks[0]) return;
        const std::size_t block = address == plugin::kParameterBlocks[1] + 4;
        ends_.at(block) = std::max(RanFor(), ends_.at(1 - block)) + chunkTime();
        if (loseAnswers) throw target::TargetError("lost");
    }
    void LoadProgram(const std::string&, const std::string&) override { Note("load"); }
    void Run() override { Note("run"); }
    void Halt() override { Note("halt"); }
    void Reset(bool) override { Note("reset"); }
    nanoseconds Now() const override { return now; }
    void Pause(nanoseconds time) override {
        GoOn();
        now += time;
    }
    bool StopsForReads() const override { return stopsForReads; }
    bool StandsStill() const override { return still_; }
    nanoseconds RanFor() const override { return (still_ ? stoppedAt_ : now) - stood_; }

    void HandingOver(const base::AddressRange&) override { log += "handing "; }
    void HandedOver(const base::AddressRange&) override { log += "handed "; }
    void Programmed(const base::AddressRange& chunk) override { Note(RangeText(chunk).c_str()); }
    void StillAtWork(const base::AddressRange&, std::chrono::seconds limit) override {
        Note(fmt::format("waiting-{}", limit.count()).c_str());
    }

  private:
    void Exchange() {
        now += exchange;
        ++packets;
    }
    void Stop() {
        if (!stopsForReads || still_) return;
        still_ = true;
        looked_ = false;
        stoppedAt_ = now;
        ++stops;
        Exchange();
    }
    void GoOn() {
        if (!still_) return;
        Exchange();
        still_ = false;
        stood_ += now - stoppedAt_;
        now += 10us;  // until the next line of the program
    }
    void Note(const char* what) {
        log +=
            fmt::format("{}@{} ", what, std::chrono::round<std::chrono::milliseconds>(now).count());
    }

    std::array<nanoseconds, 2> ends_{};
    nanoseconds stoppedAt_{0};
    nanoseconds stood_{0};
    bool still_ = false;
    bool looked_ = false;
};

struct Fixture {
    Board board;
    LoaderWait wait{board, board, [this] { return board.interrupted; }};
    bool streams = false;

    void Start() {
        wait.LoadProgram("loader", "");
        wait.Run();
    }
    /// As the plug-in does: the bytes go to their buffer, then what is to become of them.
    void HandOver(std::uint32_t number) {
        const std::string bytes(plugin::kChunkBytes, 'x');
        const auto buffer = plugin::kLoaderBuffers + number % 2 * plugin::kChunkBytes;
        if (streams) wait.Write(bytes.data(), bytes.size(), buffer, 1, 1);
        const std::uint32_t words[] = {number * 2048, 2048, plugin::kStatusPending};
        wait.Write(words, sizeof words, plugin::kParameterBlocks[number % 2] + 4, 1, 1);
    }
    bool IsPending(std::uint32_t number) {
        std::uint32_t status = 0;
        wait.Read(&status, 1, plugin::kParameterBlocks[number % 2] + 12, 1, 4);
        return status == plugin::kStatusPending;
    }
};

/// Hands chunks over as the plug-in does. What that takes is little beside what it must take: with
/// stops, 7 exchanges for two chunks and their flash's time; without, 3 for each or its flash's
/// time.
void Stream(Fixture& fixture, std::chrono::microseconds chunkTime, int variationPercent) {
    constexpr std::uint32_t kChunks = 512;
    std::mt19937 random(1);
    nanoseconds flash{0};
    fixture.streams = true;
    fixture.board.chunkTime = [&] {
        const int share = static_cast<int>(random() % 1000) - 500;
        const nanoseconds time = chunkTime + chunkTime * variationPercent * share / 50000;
        flash += time;
        return time;
    };
    fixture.Start();
    for (std::uint32_t chunk = 0; chunk < kChunks; ++chunk) {
        fixture.HandOver(chunk);
        if (chunk > 0) {
            EXPECT_FALSE(fixture.IsPending(chunk - 1));
        }
    }
    fixture.wait.AwaitIdle();
    const nanoseconds exchanges = kChunks * fixture.board.exchange;
    const nanoseconds limit =
        fixture.board.stopsForReads ? exchanges * 7 / 2 + flash : std::max(exchanges * 3, flash);
    const auto all = fmt::format(
        "{} us an exchange, {} us a chunk +-{} %: {} of {} ns, {} stops, {} packets",
        fixture.board.exchange / 1us, chunkTime.count(), variationPercent,
        fixture.board.now.count(), limit.count(), fixture.board.stops, fixture.board.packets);
    EXPECT_LE(fixture.board.now, limit + limit / 8) << all;
    EXPECT_LE(fixture.board.stops, fixture.board.stopsForReads ? kChunks * 55 / 100 : 0) << all;
    // A look at a flash that works on meanwhile costs no time.
    EXPECT_LE(fixture.board.packets, kChunks * (fixture.board.stopsForReads ? 365 : 405) / 100)
        << all;
}

TEST(LoaderWait, LosesLittleAndStopsSeldom) {
    for (const bool stopsForReads : {false, true})
        for (const auto exchange : {50us, 1000us, 3000us, 10000us})
            for (const auto chunkTime : {200us, 5000us, 20000us})
                for (const int variationPercent : {0, 10}) {
                    Fixture fixture;
                    fixture.board.exchange = exchange;
                    fixture.board.stopsForReads = stopsForReads;
                    Stream(fixture, chunkTime, variationPercent);
                }
}

// What was learned from one that hung for a while is forgotten soon.
TEST(LoaderWait, FollowsTheFlash) {
    for (const bool stopsForReads : {false, true}) {
        Fixture fixture;
        fixture.board.stopsForReads = stopsForReads;
        fixture.streams = true;
        fixture.Start();
        std::uint32_t chunk = 0;
        const auto stream = [&](std::chrono::microseconds chunkTime) {
            fixture.board.chunkTime = [=] { return chunkTime; };
            const nanoseconds before = fixture.board.now;
            for (int i = 0; i < 100; ++i, ++chunk) {
                fixture.HandOver(chunk);
                if (chunk > 0) {
                    EXPECT_FALSE(fixture.IsPending(chunk - 1));
                }
            }
            return fixture.board.now - before;
        };
        EXPECT_LE(stream(5ms), 550ms);
        EXPECT_LE(stream(40ms), 4400ms);
        EXPECT_LE(stream(5ms), 1700ms);
        EXPECT_LE(stream(5ms), 550ms);
    }
}

TEST(LoaderWait, AwaitsTheLoaderBeforeItIsStopped) {
    Fixture fixture;
    fixture.board.chunkTime = [] { return 1500ms; };
    fixture.wait.Halt();  // nothing was started: the status words are arbitrary
    EXPECT_EQ(fixture.board.looks, 0);
    fixture.Start();
    fixture.HandOver(0);
    EXPECT_TRUE(fixture.IsPending(0));  // after the plug-in's interval, and not before
    EXPECT_GE(fixture.board.now, 100ms);
    fixture.wait.Read(nullptr, 1, 0x40, 0, 1);
    fixture.HandOver(1);
    fixture.wait.Halt();
    fixture.Start();
    fixture.board.chunkTime = [] { return 31s; };
    fixture.HandOver(2);
    EXPECT_THROW(fixture.wait.Reset(false), target::TargetError);
    fixture.wait.Reset(false);
    fixture.Start();
    fixture.HandOver(3);
    EXPECT_THROW(fixture.wait.Halt(), target::TargetError);
    fixture.Start();
    fixture.board.loseAnswers = true;
    fixture.board.chunkTime = [] { return 1s; };
    EXPECT_THROW(fixture.HandOver(4), target::TargetError);
    fixture.wait.Halt();  // it was waited for, but nobody knows what the loader got
    fixture.board.loseAnswers = false;
    fixture.Start();
    fixture.HandOver(5);
    fixture.board.interrupted = true;
    EXPECT_TRUE(fixture.IsPending(5));
    fixture.wait.Halt();
    EXPECT_EQ(fixture.board.log,
              "halt@0 load@0 run@0 handing handed 0x0-0x7ff@1533 read@1533 handing handed "
              "0x800-0xfff@3033 halt@3033 load@3033 run@3033 handing handed "
              "waiting-30@6127 reset@33033 "
              "load@33033 run@33033 handing handed waiting-30@36082 halt@63033 load@63033 "
              "run@63033 handing "
              "halt@66082 load@66082 run@66082 handing handed halt@66082 ");
}

}  // namespace
}  // namespace host
