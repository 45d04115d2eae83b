// The operating system is asked to copy: it looks before it reads.

#include "hostcheck/ReadableMemory.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>

#if defined(_WIN32)
#include <windows.h>
#else
#include <sys/uio.h>
#include <unistd.h>

#include <cerrno>
#endif

namespace hostcheck {

namespace {

constexpr std::size_t kPageBytes = 4096;
constexpr std::size_t kTextBytesMax = std::size_t{64} * 1024;

}  // namespace

#if defined(_WIN32)

bool CopyReadable(void* to, const void* from, std::size_t bytes) {
    return ReadProcessMemory(GetCurrentProcess(), from, to, bytes, nullptr) != 0;
}

#else

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

#endif

// Up to the end of a page at a time: what lies behind the end of the text may belong to nobody.
std::optional<std::string> ReadableText(const char* text) {
    std::string read;
    std::array<char, kPageBytes> bytes{};
    while (read.size() < kTextBytesMax) {
        const char* next = text + read.size();
        const std::size_t count = kPageBytes - reinterpret_cast<std::uintptr_t>(next) % kPageBytes;
        if (!CopyReadable(bytes.data(), next, count)) return std::nullopt;
        const char* const first = bytes.data();
        const char* const end = std::find(first, first + count, '\0');
        read.append(first, end);
        if (end != first + count) return read;
    }
    return std::nullopt;
}

}  // namespace hostcheck
