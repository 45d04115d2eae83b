/* flash_corvane.h: the plug-in's two interfaces in C, slot by slot, for hosts that are not written
 * in C++.
 *
 * IFlashHost.h and IFlashDevice2.h are the manual: what each slot does, its units, lifetimes and
 * errors is written there, under the same names. Here is what they are to a machine. An interface
 * is a pointer to an object; the object begins with a pointer to a table of functions; each
 * function takes the object as its first argument. A host makes such an object by putting a
 * CorvaneHost first in a structure of its own:
 *
 *     struct MyHost { CorvaneHost base; int mine; };
 *     static const char* FLASH_CORVANE_CALL Halt(CorvaneHost* host) {
 *         struct MyHost* self = (struct MyHost*)host;
 *         ...
 *     }
 *     static const CorvaneHostSlots slots = { .HaltTarget = Halt, ... };
 *     struct MyHost host = { { &slots }, 0 };
 *
 * and hands &host.base to CreateFlashDevice2. Every slot of the table has to be filled but
 * the reserved ones, which are never called.
 *
 * This holds for the Itanium and for the Microsoft C++ ABI, which give the slots the same order.
 * `this` is an ordinary first argument, except on 32-bit Windows, where it goes in a register:
 * FLASH_CORVANE_CALL says so, and belongs before the name of each function that goes into a table.
 * (Microsoft's compiler takes that on member functions only: a 32-bit host in C needs another one.)
 * bool is one byte, 0 or 1.
 *
 * Needs C99 or C++11.
 */

#ifndef FLASH_CORVANE_FLASH_CORVANE_H
#define FLASH_CORVANE_FLASH_CORVANE_H

#include <stdbool.h>
#include <stddef.h>
#include <stdint.h>

/* The version of the kit that this header comes from. It says nothing about a plug-in that is
 * loaded: whatever exports CreateFlashDevice2 has exactly these two interfaces. */
#ifndef FLASH_CORVANE_VERSION
#define FLASH_CORVANE_VERSION_MAJOR 1
#define FLASH_CORVANE_VERSION_MINOR 1
#define FLASH_CORVANE_VERSION_PATCH 0
#define FLASH_CORVANE_VERSION "1.1.0"
#endif

#if !defined(_WIN32) || !(defined(_M_IX86) || defined(__i386__))
#define FLASH_CORVANE_CALL
#elif defined(__GNUC__)
#define FLASH_CORVANE_CALL __attribute__((thiscall))
#ifndef __clang__
/* With -pedantic, GCC warns of thiscall on a function that is no member. It is meant, in the slots
 * below as in yours, so the warning is off up to the end of your file. */
#pragma GCC diagnostic ignored "-Wattributes"
#endif
#else
#define FLASH_CORVANE_CALL __thiscall
#endif

#if defined(_WIN32)
#define FLASH_CORVANE_CDECL __cdecl
#else
#define FLASH_CORVANE_CDECL
#endif

#ifdef __cplusplus
extern "C" {
#endif

/* What the host implements. */
typedef struct CorvaneHostSlots CorvaneHostSlots;
typedef struct CorvaneHost {
    const CorvaneHostSlots* slots;
} CorvaneHost;

/* Each returns null for success or an error text, GetProperty and GetDirectory excepted. */
struct CorvaneHostSlots {
    /* 0 */ const char*(FLASH_CORVANE_CALL* GetProperty)(CorvaneHost* host, const char* name);
    /* 1 */ const char*(FLASH_CORVANE_CALL* SetProperty)(CorvaneHost* host, const char* name,
                                                         const char* value);
    /* 2 */ const char*(FLASH_CORVANE_CALL* LoadProgram)(CorvaneHost* host, const char* fileName,
                                                         const char* second, const char* directory);
    /* 3 */ const char*(FLASH_CORVANE_CALL* Reserved3)(CorvaneHost* host);
    /* 4 */ const char*(FLASH_CORVANE_CALL* RunTarget)(CorvaneHost* host);
    /* 5 */ const char*(FLASH_CORVANE_CALL* Reserved5)(CorvaneHost* host);
    /* 6 */ const char*(FLASH_CORVANE_CALL* HaltTarget)(CorvaneHost* host);
    /* 7 */ const char*(FLASH_CORVANE_CALL* ResetTarget)(CorvaneHost* host, bool flag);
    /* 8 */ const char*(FLASH_CORVANE_CALL* Reserved8)(CorvaneHost* host);
    /* 9 */ const char*(FLASH_CORVANE_CALL* Reserved9)(CorvaneHost* host);
    /* One call reads at most 32752 bytes and writes at most 2048; the target may be running. */
    /* 10 */ const char*(FLASH_CORVANE_CALL* ReadMemory)(CorvaneHost* host, void* buffer,
                                                         size_t count, uint64_t address,
                                                         int16_t page, size_t width);
    /* 11 */ const char*(FLASH_CORVANE_CALL* WriteMemory)(CorvaneHost* host, const void* buffer,
                                                          size_t count, uint64_t address,
                                                          int16_t page, size_t width);
    /* 12 */ const char*(FLASH_CORVANE_CALL* Reserved12)(CorvaneHost* host);
    /* 13 */ const char*(FLASH_CORVANE_CALL* Reserved13)(CorvaneHost* host);
    /* 14 */ const char*(FLASH_CORVANE_CALL* Reserved14)(CorvaneHost* host);
    /* 15 */ const char*(FLASH_CORVANE_CALL* Reserved15)(CorvaneHost* host);
    /* 16 */ const char*(FLASH_CORVANE_CALL* BeginProgress)(CorvaneHost* host, const char* title);
    /* 17 */ const char*(FLASH_CORVANE_CALL* UpdateProgress)(CorvaneHost* host, uint32_t percent,
                                                             const char* text);
    /* 18 */ const char*(FLASH_CORVANE_CALL* EndProgress)(CorvaneHost* host);
    /* 19 */ const char*(FLASH_CORVANE_CALL* ShowError)(CorvaneHost* host, const char* text);
    /* 20 */ const char*(FLASH_CORVANE_CALL* ShowMessage)(CorvaneHost* host, const char* text);
    /* 21 */ const char*(FLASH_CORVANE_CALL* GetDirectory)(CorvaneHost* host);
    /* 22 */ const char*(FLASH_CORVANE_CALL* Sleep)(CorvaneHost* host, uint32_t milliseconds);
};

/* What the plug-in implements. */
typedef struct CorvaneDeviceSlots CorvaneDeviceSlots;
typedef struct CorvaneDevice {
    const CorvaneDeviceSlots* slots;
} CorvaneDevice;

/* Each returns null for success or an error text, Destroy excepted. WriteDataToFlash,
 * PerformOperation and ResetSettings also return null after a failure that they have shown through
 * ShowError. The overloads of the C++ interface have names of their own here. */
struct CorvaneDeviceSlots {
    /* 0 */ const char*(FLASH_CORVANE_CALL* Initialize)(CorvaneDevice* device, bool* flashAvailable,
                                                        const char** operations);
    /* 1 */ const char*(FLASH_CORVANE_CALL* AddressWithinFlash)(CorvaneDevice* device,
                                                                uint64_t address, bool* within);
    /* 2 */ const char*(FLASH_CORVANE_CALL* RangeWithinFlash)(CorvaneDevice* device,
                                                              uint64_t address, int32_t size,
                                                              bool* within);
    /* 3 */ const char*(FLASH_CORVANE_CALL* WriteHalfwordsToFlash)(CorvaneDevice* device,
                                                                   const uint16_t* data,
                                                                   uint64_t address,
                                                                   uint32_t length, int16_t page);
    /* 4 */ const char*(FLASH_CORVANE_CALL* WriteDataToFlash)(CorvaneDevice* device,
                                                              const unsigned char* data,
                                                              uint64_t address, uint32_t length,
                                                              int16_t page);
    /* 5 */ const char*(FLASH_CORVANE_CALL* PerformOperation)(CorvaneDevice* device,
                                                              const char* operation);
    /* 6 */ const char*(FLASH_CORVANE_CALL* ResetSettings)(CorvaneDevice* device, int32_t mode);
    /* 7 */ const char*(FLASH_CORVANE_CALL* AddressWithinSpecialRegion)(CorvaneDevice* device,
                                                                        uint64_t address,
                                                                        bool* result);
    /* 8 */ void(FLASH_CORVANE_CALL* Destroy)(CorvaneDevice* device);
};

/* The type of the one exported function, "CreateFlashDevice2", to be looked up in the loaded
 * library. An ordinary C function on every system. */
typedef const char*(FLASH_CORVANE_CDECL* CorvaneCreateFlashDevice2)(const char* variant,
                                                                    const char* text2,
                                                                    const char* text3,
                                                                    CorvaneHost* host,
                                                                    CorvaneDevice** device);

#ifdef __cplusplus
}
#endif

#endif
