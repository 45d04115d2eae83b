// Signals and their mask.

#include "base/system/Signals.h"

#include <signal.h>

#include <chrono>
#include <csignal>

namespace base {

namespace {

constexpr int kSignals[] = {SIGINT, SIGTERM, SIGHUP};

volatile std::sig_atomic_t caught = 0;

// `timeout`, for one, signals the process and then its whole group: that is one wish, not two.
constexpr std::chrono::milliseconds kOneWish{200};

sigset_t AllSignals() {
    sigset_t all;
    sigemptyset(&all);
    for (const int number : kSignals)
        sigaddset(&all, number);
    return all;
}

void Remember(int number) {
    static constinit std::chrono::steady_clock::time_point first;
    const auto now = std::chrono::steady_clock::now();
    if (caught == 0) {
        first = now;
        caught = 1;
    } else if (now - first > kOneWish) {
        std::signal(number, SIG_DFL);
        std::raise(number);
    }
}

}  // namespace

struct SignalsHeld::Before {
    sigset_t mask;
};

void CatchSignals() {
    struct sigaction action {};
    action.sa_handler = Remember;
    action.sa_flags = SA_RESTART;
    action.sa_mask = AllSignals();
    for (const int number : kSignals) {
        struct sigaction before {};
        sigaction(number, &action, &before);
        if (number == SIGHUP && before.sa_handler == SIG_IGN) sigaction(number, &before, nullptr);
    }
    std::signal(SIGPIPE, SIG_IGN);
    std::signal(SIGXFSZ, SIG_IGN);
}

bool HasCaughtSignal() {
    return caught != 0;
}

SignalsHeld::SignalsHeld() : before_(std::make_unique<Before>()) {
    const sigset_t held = AllSignals();
    sigprocmask(SIG_BLOCK, &held, &before_->mask);
}

SignalsHeld::~SignalsHeld() {
    sigprocmask(SIG_SETMASK, &before_->mask, nullptr);
}

}  // namespace base
