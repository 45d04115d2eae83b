#include "tests/support/VirtualTime.h"

#include <poll.h>
#include <sys/syscall.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>

namespace {

std::atomic<long long> nowNs{1'000'000'000};

// Looking at the clock takes time too, or a loop that only waits for it would never end.
constexpr long long LookNs = 1'000'000;

// Another thread of the process answers within this time, or not at all.
constexpr int kPatienceMs = 5;
std::atomic<int> patienceMs{kPatienceMs};

}  // namespace

std::chrono::nanoseconds test::VirtualNow() {
    return std::chrono::nanoseconds(nowNs);
}

test::Patience::Patience() {
    patienceMs = 1000;
}

test::Patience::~Patience() {
    patienceMs = kPatienceMs;
}

// These stand before the C library's in the look-up order of everything that the process loads.
extern "C" {

__attribute__((visibility("default"))) int clock_gettime(clockid_t clock,
                                                         struct timespec* time) noexcept {
    if (clock != CLOCK_MONOTONIC) {
        return static_cast<int>(syscall(SYS_clock_gettime, clock, time));
    }
    const long long now = nowNs += LookNs;
    time->tv_sec = now / 1'000'000'000;
    time->tv_nsec = now % 1'000'000'000;
    return 0;
}

__attribute__((visibility("default"))) int nanosleep(const struct timespec* time,
                                                     struct timespec*) {
    nowNs += time->tv_sec * 1'000'000'000LL + time->tv_nsec;
    return 0;
}

__attribute__((visibility("default"))) int clock_nanosleep(clockid_t, int flags,
                                                           const struct timespec* time,
                                                           struct timespec* left) {
    if ((flags & TIMER_ABSTIME) == 0) return nanosleep(time, left);
    const long long until = time->tv_sec * 1'000'000'000LL + time->tv_nsec;
    if (until > nowNs) nowNs = until;
    return 0;
}

__attribute__((visibility("default"))) int poll(struct pollfd* files, nfds_t count, int timeoutMs) {
    const int waitMs = std::min(timeoutMs, patienceMs.load());
    const timespec wait{waitMs / 1000, waitMs % 1000 * 1'000'000L};
    const timespec* const limit = timeoutMs < 0 ? nullptr : &wait;
    const auto ready = static_cast<int>(syscall(SYS_ppoll, files, count, limit, nullptr, 0));
    if (ready == 0) nowNs += timeoutMs * 1'000'000LL;
    return ready;
}
}
