// Ctrl-C as a flag that is asked for between two steps.

#include "host/base/Interrupt.h"

#include <chrono>
#include <csignal>
#include <utility>

#include "host/base/Errors.h"

namespace host {

namespace {

constexpr int kSignals[] = {SIGINT, SIGTERM, SIGHUP};

volatile std::sig_atomic_t interrupted = 0;

InterruptSource* otherSource = nullptr;

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
    if (interrupted == 0) {
        first = now;
        interrupted = 1;
    } else if (now - first > kOneWish) {
        std::signal(number, SIG_DFL);
        std::raise(number);
    }
}

}  // namespace

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

bool Interrupted() {
    return interrupted != 0 || (otherSource != nullptr && otherSource->HasInterrupted());
}

InterruptSource::InterruptSource(std::function<bool()> asked) : asked_(std::move(asked)) {
    otherSource = this;
}

InterruptSource::~InterruptSource() {
    otherSource = nullptr;
}

bool InterruptSource::HasInterrupted() {
    // Whoever is asked may wait for something itself, and so ask whether to go on.
    if (std::exchange(asking_, true)) return interrupted_;
    interrupted_ = interrupted_ || asked_();
    asking_ = false;
    return interrupted_;
}

void ThrowIfInterrupted() {
    if (Interrupted()) throw Failure(ExitStatus::Interrupted, "interrupted");
}

SignalsHeld::SignalsHeld() {
    const sigset_t held = AllSignals();
    sigprocmask(SIG_BLOCK, &held, &before_);
}

SignalsHeld::~SignalsHeld() {
    sigprocmask(SIG_SETMASK, &before_, nullptr);
}

}  // namespace host
