// The console tells of Ctrl-C, Ctrl-Break and its closing on a thread of the system's.

#include "base/system/Signals.h"

#include <windows.h>

#include <atomic>

namespace base {

namespace {

std::atomic<bool> caught = false;
std::atomic<int> holders = 0;

// What comes together is one wish.
constexpr ULONGLONG kOneWishMs = 200;

// As long as the system waits for a program before it ends it.
constexpr DWORD kClosingMs = 5000;

BOOL WINAPI Remember(DWORD event) {
    static std::atomic<ULONGLONG> first = 0;
    const bool closes = event != CTRL_C_EVENT && event != CTRL_BREAK_EVENT;
    if (!caught.exchange(true)) first = GetTickCount64();
    // The process ends when this returns: the work may go on until then.
    if (closes) Sleep(kClosingMs);
    if (closes || GetTickCount64() - first <= kOneWishMs) return TRUE;
    while (holders != 0)
        Sleep(1);
    return FALSE;  // whoever comes next ends the process
}

}  // namespace

struct SignalsHeld::Before {};

void CatchSignals() {
    SetConsoleCtrlHandler(Remember, TRUE);
}

bool HasCaughtSignal() {
    return caught;
}

SignalsHeld::SignalsHeld() {
    ++holders;
}

SignalsHeld::~SignalsHeld() {
    --holders;
}

}  // namespace base
