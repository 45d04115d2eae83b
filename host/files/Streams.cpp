// Waiting with poll: unlike a blocked read or write it can look for Ctrl-C now and then, so that no
// signal comes in a moment in which it goes unnoticed.

#include "host/files/Streams.h"

#include <fcntl.h>
#include <limits.h>
#include <poll.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

#include "host/base/Interrupt.h"

namespace host {

bool WaitUntilReady(int descriptor, short events) {
    constexpr int kLookMs = 100;
    for (;;) {
        pollfd waited{descriptor, events, 0};
        if (poll(&waited, 1, kLookMs) > 0) return true;
        if (Interrupted()) return false;
    }
}

int WriteAll(int descriptor, std::string_view bytes) {
    while (!bytes.empty()) {
        if (!WaitUntilReady(descriptor, POLLOUT)) return EINTR;
        // A pipe that is ready takes this much without blocking, whatever its mode.
        const std::size_t size = std::min<std::size_t>(bytes.size(), PIPE_BUF);
        const ssize_t count = write(descriptor, bytes.data(), size);
        if (count < 0 && errno != EINTR && errno != EAGAIN) return errno;
        bytes.remove_prefix(static_cast<std::size_t>(std::max<ssize_t>(count, 0)));
    }
    return 0;
}

void OccupyStandardStreams() {
    for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO})
        // The lowest free number is taken, which is this one.
        if (fcntl(stream, F_GETFD) < 0) open("/dev/null", stream == 0 ? O_WRONLY : O_RDONLY);
}

}  // namespace host
