// Waiting in slices: unlike a blocked read or write this can look for Ctrl-C now and then, so that
// no signal comes in a moment in which it goes unnoticed.

#include "host/files/Streams.h"

#include <cerrno>
#include <chrono>

#include "base/system/Files.h"
#include "host/base/Interrupt.h"

namespace host {

bool WaitUntilReady(int file, base::Ready ready) {
    constexpr std::chrono::milliseconds kSlice{100};
    for (;;) {
        if (base::AwaitFile(file, ready, kSlice)) return true;
        if (Interrupted()) return false;
    }
}

int WriteAll(int file, std::string_view bytes) {
    while (!bytes.empty()) {
        if (!WaitUntilReady(file, base::Ready::ToWrite)) return EINTR;
        const auto count = base::WriteTo(file, bytes);
        if (!count && errno != EAGAIN) return errno;
        bytes.remove_prefix(count.value_or(0));
    }
    return 0;
}

}  // namespace host
