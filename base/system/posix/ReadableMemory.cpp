// The system is asked to copy: it looks before it reads.

#include "base/system/ReadableMemory.h"

#include <sys/uio.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace base {

// Where the call is forbidden, as in some containers, there is nothing left but to trust.
bool CopyReadable(void* to, const void* from, std::size_t bytes) {
    const iovec local{to, bytes};
    const iovec remote{const_cast<void*>(from), bytes};
    const ssize_t copied = process_vm_readv(getpid(), &local, 1, &remote, 1, 0);
    if (copied >= 0) return static_cast<std::size_t>(copied) == bytes;
    if (errno == EFAULT) return false;
    std::memcpy(to, from, bytes);
    return true;
}

}  // namespace base
