// Ctrl-C as a flag that is asked for between two steps.

#include "host/base/Interrupt.h"

#include <csignal>

#include "host/base/Errors.h"

namespace host {

namespace {

constexpr int kSignals[] = {SIGINT, SIGTERM, SIGHUP};

volatile std::sig_atomic_t interrupted = 0;

void Remember(int) {
    interrupted = 1;
    // Whichever comes next is not caught any more.
    for (const int number : kSignals)
        std::signal(number, SIG_DFL);
}

}  // namespace

void CatchSignals() {
    struct sigaction action {};
    action.sa_handler = Remember;
    action.sa_flags = SA_RESTART;
    for (const int number : kSignals) {
        struct sigaction before {};
        sigaction(number, &action, &before);
        if (number == SIGHUP && before.sa_handler == SIG_IGN) sigaction(number, &before, nullptr);
    }
    std::signal(SIGPIPE, SIG_IGN);
    std::signal(SIGXFSZ, SIG_IGN);
}

bool Interrupted() {
    return interrupted != 0;
}

void ThrowIfInterrupted() {
    if (Interrupted()) throw Failure(ExitStatus::Interrupted, "interrupted");
}

SignalsHeld::SignalsHeld() {
    sigset_t held;
    sigemptyset(&held);
    for (const int number : kSignals)
        sigaddset(&held, number);
    sigprocmask(SIG_BLOCK, &held, &before_);
}

SignalsHeld::~SignalsHeld() {
    sigprocmask(SIG_SETMASK, &before_, nullptr);
}

}  // namespace host
