// What the host of these tests takes from the system under it. Neither a C library's headers nor
// the Windows SDK are at hand where it is compiled for Microsoft's ABI, so all of it is declared
// here.

#pragma once

#include <stdarg.h>
#include <stddef.h>

extern "C" {
[[noreturn]] void exit(int);
int printf(const char*, ...);
int fflush(void* file);
int vsprintf(char*, const char*, va_list);
void* memcpy(void*, const void*, size_t);
void* memset(void*, int, size_t);
int strcmp(const char*, const char*);

#if defined(_WIN32)
__declspec(dllimport) void* __stdcall LoadLibraryA(const char* name);
__declspec(dllimport) void* __stdcall GetModuleHandleA(const char* name);
__declspec(dllimport) void* __stdcall GetProcAddress(void* library, const char* name);
__declspec(dllimport) int __stdcall FreeLibrary(void* library);
int _setmode(int file, int mode);
#else
void* dlopen(const char* name, int mode);
void* dlsym(void* library, const char* name);
int dlclose(void* library);
#endif
}

#if defined(_WIN32)

inline void* Load(const char* name) {
    return LoadLibraryA(name);
}
inline bool IsLoaded(const char* name) {
    return GetModuleHandleA(name) != nullptr;
}
inline void* Find(void* library, const char* name) {
    return GetProcAddress(library, name);
}
inline void Unload(void* library) {
    FreeLibrary(library);
}
constexpr const char* kPlugin = "flash_corvane.dll";
constexpr const char* kLogger = "ostrel_logger.dll";

#else

inline void* Load(const char* name) {
    return dlopen(name, 2 /* RTLD_NOW */);
}
inline bool IsLoaded(const char* name) {
    void* library = dlopen(name, 6 /* RTLD_NOW | RTLD_NOLOAD */);
    if (library != nullptr) dlclose(library);
    return library != nullptr;
}
inline void* Find(void* library, const char* name) {
    return dlsym(library, name);
}
inline void Unload(void* library) {
    dlclose(library);
}
constexpr const char* kPlugin = "./libflash_corvane.so";
constexpr const char* kLogger = "./libostrel_logger.so";

#endif
