// The entry point of each library: gives back, when the library is unloaded, what the C++ runtime
// that is linked into it keeps.
//
// That runtime takes a thread-local index at the first exception (on 32 bit as soon as it is
// loaded) and never frees it, since it expects to live as long as the process. A process has 1088
// of them, and a debugger that loads and unloads plug-ins all day would run out of them and be
// aborted. So its calls of TlsAlloc come here first.

#include <windows.h>

#if defined(_WIN64)
#define TLS_ALLOC_SYMBOL(prefix) prefix "__imp_TlsAlloc"
#else
#define TLS_ALLOC_SYMBOL(prefix) "_" prefix "_imp__TlsAlloc@0"
#endif

using TlsAllocFunction = DWORD(WINAPI*)();

extern "C" {

// The linker gives the import these names, for it is told to wrap it.
extern TlsAllocFunction realTlsAlloc __asm__(TLS_ALLOC_SYMBOL("__real_"));
extern TlsAllocFunction wrappedTlsAlloc __asm__(TLS_ALLOC_SYMBOL("__wrap_"));

BOOL WINAPI DllMainCRTStartup(HINSTANCE library, DWORD reason, LPVOID reserved);
BOOL WINAPI LibraryEntry(HINSTANCE library, DWORD reason, LPVOID reserved);
}

namespace {

constexpr LONG kMostIndices = 8;
DWORD indices[kMostIndices];
LONG indexCount = 0;

DWORD WINAPI TlsAllocRemembered() {
    const DWORD index = realTlsAlloc();
    if (index == TLS_OUT_OF_INDEXES) return index;
    const LONG place = InterlockedIncrement(&indexCount) - 1;
    if (place < kMostIndices) indices[place] = index;
    return index;
}

}  // namespace

TlsAllocFunction wrappedTlsAlloc = TlsAllocRemembered;

// The runtime's own entry point runs all destructors; nothing of it runs after that. At the end of
// the process (reserved is not null) the system takes everything back by itself.
BOOL WINAPI LibraryEntry(HINSTANCE library, DWORD reason, LPVOID reserved) {
    const BOOL done = DllMainCRTStartup(library, reason, reserved);
    if (reason == DLL_PROCESS_DETACH && reserved == nullptr) {
        for (LONG i = 0; i < indexCount && i < kMostIndices; ++i)
            TlsFree(indices[i]);
    }
    return done;
}
