// The system is asked to copy: it looks before it reads.

#include "base/system/ReadableMemory.h"

#include <windows.h>

namespace base {

bool CopyReadable(void* to, const void* from, std::size_t bytes) {
    return ReadProcessMemory(GetCurrentProcess(), from, to, bytes, nullptr) != 0;
}

}  // namespace base
