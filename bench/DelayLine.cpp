#include "bench/DelayLine.h"

#include <sys/prctl.h>

#include <condition_variable>
#include <deque>
#include <mutex>
#include <string>
#include <utility>

namespace bench {

namespace {

namespace gdb = target::gdb;
using Clock = std::chrono::steady_clock;

constexpr std::chrono::milliseconds kBetweenChecks(50);

/// What is on its way, with the time at which it arrives.
class InTransit {
  public:
    void Add(Clock::time_point due, std::string bytes) {
        const std::lock_guard lock(mutex_);
        bytes_.emplace_back(due, std::move(bytes));
        added_.notify_one();
    }
    void End() {
        const std::lock_guard lock(mutex_);
        ended_ = true;
        added_.notify_one();
    }
    /// The next that arrives, at that time; nothing after the end.
    std::string Await() {
        std::unique_lock lock(mutex_);
        added_.wait(lock, [&] { return ended_ || !bytes_.empty(); });
        if (bytes_.empty()) return {};
        auto [due, bytes] = std::move(bytes_.front());
        bytes_.pop_front();
        lock.unlock();
        std::this_thread::sleep_until(due);
        return bytes;
    }

  private:
    std::mutex mutex_;
    std::condition_variable added_;
    std::deque<std::pair<Clock::time_point, std::string>> bytes_;
    bool ended_ = false;
};

}  // namespace

DelayLine::DelayLine(const gdb::Address& server, std::chrono::nanoseconds delay)
    : server_(server),
      delay_(delay),
      listener_(
          gdb::Socket::Listen(gdb::Address::Parse("127.0.0.1:0"), [this] { return done_.load(); })),
      thread_([this] { Run(); }) {}

DelayLine::~DelayLine() {
    done_ = true;
    thread_.join();
}

gdb::Address DelayLine::Where() const {
    return {"127.0.0.1", std::to_string(listener_.Port())};
}

void DelayLine::Run() {
    gdb::Socket client = listener_.Accept(gdb::After(std::chrono::seconds(10)));
    if (!client.IsOpen()) return;
    gdb::Socket server = gdb::Socket::Connect(server_, gdb::After(std::chrono::seconds(10)), {});
    std::thread replies([&] { HandOnReplies(server, client); });
    HandOnRequests(client, server);
    replies.join();
}

void DelayLine::HandOnRequests(gdb::Socket& client, gdb::Socket& server) {
    InTransit bytes;
    std::thread sender([&] {
        // A sleep that ends when it should: the system allows itself 50 us otherwise.
        prctl(PR_SET_TIMERSLACK, 1);
        try {
            for (std::string next = bytes.Await(); !next.empty(); next = bytes.Await())
                server.Write(next, gdb::After(std::chrono::seconds(1)));
        } catch (const gdb::SocketError&) {
            // The client is told by the end of the replies.
        }
    });
    try {
        while (!done_) {
            std::string arrived = client.Read(gdb::After(kBetweenChecks));
            if (!arrived.empty()) bytes.Add(Clock::now() + delay_, std::move(arrived));
        }
    } catch (const gdb::SocketError&) {
        // The client is gone.
    }
    bytes.End();
    sender.join();
    done_ = true;
}

void DelayLine::HandOnReplies(gdb::Socket& server, gdb::Socket& client) try {
    while (!done_) {
        const std::string arrived = server.Read(gdb::After(kBetweenChecks));
        if (!arrived.empty()) client.Write(arrived, gdb::After(std::chrono::seconds(1)));
    }
} catch (const gdb::SocketError&) {
    done_ = true;
}

}  // namespace bench
