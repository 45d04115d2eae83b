// The system is asked to copy, through a pipe: it looks before it reads. It does so in every
// container and emulator, where reading by process_vm_readv() may be forbidden.

#include "base/system/ReadableMemory.h"

#include <fcntl.h>
#include <limits.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>

namespace base {

namespace {

/// As much as a pipe takes at once. The call is made here, because a sanitizer's write() reads what
/// it is given.
bool CopyPiece(const int* ends, char* to, const char* from, std::size_t bytes) {
    return syscall(SYS_write, ends[1], from, bytes) == static_cast<long>(bytes) &&
           read(ends[0], to, bytes) == static_cast<ssize_t>(bytes);
}

}  // namespace

// Where there can be no pipe, there is nothing left but to trust.
bool CopyReadable(void* to, const void* from, std::size_t bytes) {
    int ends[2];
    if (pipe2(ends, O_CLOEXEC | O_NONBLOCK) != 0) {
        std::memcpy(to, from, bytes);
        return true;
    }
    bool copied = true;
    for (std::size_t at = 0; copied && at < bytes; at += PIPE_BUF)
        copied = CopyPiece(ends, static_cast<char*>(to) + at, static_cast<const char*>(from) + at,
                           std::min<std::size_t>(PIPE_BUF, bytes - at));
    close(ends[0]);
    close(ends[1]);
    return copied;
}

}  // namespace base
