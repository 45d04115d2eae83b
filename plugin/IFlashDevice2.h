// IFlashDevice2: what the flash plug-in does for a debugging host, and the one function that the
// library exports to make one.
//
// A host loads the library, looks up CreateFlashDevice2 by its undecorated name, and creates one
// device object for each connected microcontroller. Creating it already identifies the device.
// Through the interface the host then asks whether there is flash, writes program sections into
// it, and runs the operations that its user chooses.
//
// This header is a binary contract. The order of the slots is the contract: it never changes, and
// no slot is ever removed. It needs nothing but the two standard headers below and compiles from
// C++11 on.
//
// Errors. Every slot but Destroy returns null for success or a NUL-terminated error text for
// failure. The text belongs to the device object and stays valid until the next failing call on
// the same object, or until Destroy. A failing call writes none of its outputs. A user operation
// that fails is not a failing call: the user has been shown why, through IFlashHost::ShowError.
// No exception leaves the library.
//
// Threads. The calls on one device object come one at a time, from whichever thread. Those of
// CreateFlashDevice2 come one at a time in the whole process. Every call runs to its end on the
// caller's thread, calling the host's slots as it goes.
//
// Pointers. None may be null but where it is said: outputs are written without a test. Texts are
// NUL-terminated bytes and are not used after the call; null counts as an empty text.
//
// Each slot ends with a tag: who implements it, and when the host may call it.

#ifndef FLASH_CORVANE_IFLASHDEVICE2_H
#define FLASH_CORVANE_IFLASHDEVICE2_H

#include <stddef.h>
#include <stdint.h>

// The version of the kit that this header comes from, for hosts that are built against several. It
// says nothing about a plug-in that is loaded: whatever exports CreateFlashDevice2 has exactly this
// interface and wants exactly that IFlashHost. A change of either would be a new function.
#ifndef FLASH_CORVANE_VERSION
#define FLASH_CORVANE_VERSION_MAJOR 1
#define FLASH_CORVANE_VERSION_MINOR 1
#define FLASH_CORVANE_VERSION_PATCH 0
#define FLASH_CORVANE_VERSION "1.1.0"
#endif

class IFlashHost;

class IFlashDevice2 {
  public:
    // Slot 0. Publishes the device information ("DeviceInfoFlashSize", "DeviceInfoRAMSize",
    // "DeviceInfoSectorSize", "DeviceInfoFamily") through IFlashHost::SetProperty. May be called
    // again at any time.
    // flashAvailable receives whether the device has flash. operations receives a pointer to the
    // names of the operations for PerformOperation, joined by " | "; the text is constant and
    // lives as long as the library is loaded. Neither pointer may be null.
    // [device implements; any time after creation]
    virtual const char* Initialize(bool* flashAvailable, const char** operations) = 0;

    // Slot 1. Writes to within whether the byte at address lies in flash. Without flash, no
    // address does. An address above 0xFFFFFFFF fails with "Address value is too big".
    // [device implements; any time after creation]
    //
    //     AddressWithinFlash(uint64_t address, bool* within)
    //
    // Slot 2. Writes to within whether address and address + size both lie in flash, the sum
    // taken modulo 2^32. Mind the bound: address + size is the byte BEHIND the range, so a range
    // that ends with the last byte of flash yields false. To ask about a range, ask about its
    // first and its last byte with slot 1. size is in bytes.
    // [device implements; any time after creation]
    //
    //     AddressWithinFlash(uint64_t address, int32_t size, bool* within)
    //
    // Slot 3. Stands for target data units other than a byte. Fails with "Unsupported target data
    // type", whatever its arguments, and reads none of them.
    // [device implements; any time after creation]
    //
    //     WriteDataToFlash(const uint16_t* data, uint64_t address, uint32_t length, int16_t page)
    //
    // Slot 4. Writes one section of a program image: length bytes from data to the flash address,
    // erasing and blank-checking first as the host's settings say. page is the host's number of
    // the target's memory space and is passed through to its memory slots. data belongs to the
    // caller and is not used after the call; it may be null when length is 0, which loads and
    // starts the flash loader and at most rewrites the block at address with what it holds. The
    // 128-byte blocks that the section begins and ends in are completed with what the target
    // holds. The range is not compared with the size of the flash. Call ResetSettings before the
    // first section of each image. Success of the call does not tell that the section was written:
    // a failure that was shown to the user through IFlashHost::ShowError returns null here.
    // [device implements; any time after creation]
    //
    //     WriteDataToFlash(const unsigned char* data, uint64_t address, uint32_t length,
    //                      int16_t page)
    //
    // Compilers of the Microsoft C++ ABI lay out the overloads of one name in reverse order of
    // declaration. Declared the other way round there, they get the same slots everywhere.
#if defined(_MSC_VER)
    virtual const char* AddressWithinFlash(uint64_t address, int32_t size, bool* within) = 0;
    virtual const char* AddressWithinFlash(uint64_t address, bool* within) = 0;
    virtual const char* WriteDataToFlash(const unsigned char* data, uint64_t address,
                                         uint32_t length, int16_t page) = 0;
    virtual const char* WriteDataToFlash(const uint16_t* data, uint64_t address, uint32_t length,
                                         int16_t page) = 0;
#else
    virtual const char* AddressWithinFlash(uint64_t address, bool* within) = 0;
    virtual const char* AddressWithinFlash(uint64_t address, int32_t size, bool* within) = 0;
    virtual const char* WriteDataToFlash(const uint16_t* data, uint64_t address, uint32_t length,
                                         int16_t page) = 0;
    virtual const char* WriteDataToFlash(const unsigned char* data, uint64_t address,
                                         uint32_t length, int16_t page) = 0;
#endif

    // Slot 5. Runs the operation of that exact, case-sensitive name (see Initialize). What it
    // does, it takes from the host's settings; what it finds, it shows through ShowMessage and
    // ShowError. An operation that failed and has said so to the user returns null. An
    // operation that is null or not known fails, as any other operation does.
    // [device implements; any time after creation]
    virtual const char* PerformOperation(const char* operation) = 0;

    // Slot 6. Resets the state of a program load: one target reset is allowed again, no sector
    // counts as erased, and the load's erase is to be done again. Resets the target at once when
    // the setting "FlashResetSetting" is on. mode changes that, or adds to it:
    //     0   nothing more; for the start of a load
    //     1   no target reset; the watchdogs are reset and "FlashChecksumValue" becomes "--"
    //     2   calculates the CRC-32 of the whole flash when "FlashProgramCRCOption" is on; for
    //         the end of a load
    //     4   a load's erase that has been done still counts as done
    // Any other mode is as 0. When the call fails, the state of the load has been reset all the
    // same. A checksum of mode 2 that failed has been shown to the user through
    // IFlashHost::ShowError, and the call returns null.
    // [device implements; any time after creation]
    virtual const char* ResetSettings(int32_t mode) = 0;

    // Slot 7. Writes false to result: the device has no special region. An address above
    // 0xFFFFFFFF fails with "Address value is too big".
    // [device implements; any time after creation]
    virtual const char* AddressWithinSpecialRegion(uint64_t address, bool* result) = 0;

    // Slot 8. Deletes the object. Every text that it has returned is gone with it, the operation
    // list excepted. The host is not called.
    // [device implements; once, as the last call]
    virtual void Destroy() = 0;

  protected:
    // Only Destroy ends a device object.
    ~IFlashDevice2() = default;
};

#if defined(_WIN32)
// 32-bit Windows has several calling conventions, and compilers have options for the default.
#define FLASH_CORVANE_CDECL __cdecl
#else
#define FLASH_CORVANE_CDECL
#endif

// Creates a device object for the connected microcontroller: reads its identification registers
// through host and halts it.
//     variant       the name that the host has for the device; it goes into the trace and
//                   decides nothing
//     text2, text3  two further texts, not used
//     host          the services of the caller, which keeps it alive and owns it until after
//                   Destroy; not null and not checked
//     device        receives the interface on success and is left alone on failure; not null
// Returns null, or the text of what failed. The text belongs to the library and stays valid until
// the next failing call of this function, or until the library is unloaded.
extern "C"
#if defined(__GNUC__) && !defined(_WIN32)
    __attribute__((visibility("default")))
#endif
    const char* FLASH_CORVANE_CDECL
    CreateFlashDevice2(const char* variant, const char* text2, const char* text3, IFlashHost* host,
                       IFlashDevice2** device);

// The type of CreateFlashDevice2, for hosts that look it up in the loaded library.
typedef const char*(FLASH_CORVANE_CDECL* CreateFlashDevice2Function)(const char* variant,
                                                                     const char* text2,
                                                                     const char* text3,
                                                                     IFlashHost* host,
                                                                     IFlashDevice2** device);

#endif
