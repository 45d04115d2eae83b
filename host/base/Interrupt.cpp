// Ctrl-C as a flag that is asked for between two steps.

#include "host/base/Interrupt.h"

#include <csignal>

namespace host {

namespace {

volatile std::sig_atomic_t interrupted = 0;

void Remember(int) {
    interrupted = 1;
    // Whichever of the two comes next is not caught any more.
    std::signal(SIGINT, SIG_DFL);
    std::signal(SIGTERM, SIG_DFL);
}

}  // namespace

void CatchInterrupts() {
    struct sigaction action {};
    action.sa_handler = Remember;
    action.sa_flags = SA_RESTART;
    sigaction(SIGINT, &action, nullptr);
    sigaction(SIGTERM, &action, nullptr);
    std::signal(SIGPIPE, SIG_IGN);
}

bool Interrupted() {
    return interrupted != 0;
}

}  // namespace host
