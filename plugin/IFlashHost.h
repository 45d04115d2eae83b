// IFlashHost: what a debugging host does for the flash plug-in.
//
// The plug-in touches nothing by itself. Every register access, message, progress display, pause
// and setting is a call of one of the slots below. The slots are called on the thread that made the
// call of IFlashDevice2 or CreateFlashDevice2, while it lasts. A slot must not call back into the
// device object that is calling it.
//
// This header is a binary contract. The order of the slots is the contract: it never changes, and
// no slot is ever removed. It needs nothing but the two standard headers below and compiles from
// C++11 on.
//
// Errors. Every slot that returns `const char*` returns null for success or a NUL-terminated error
// text for failure, GetProperty and GetDirectory excepted. The text belongs to the host and must
// stay valid until the next call of any slot; by then the plug-in has copied it. An empty text is
// a failure too. A failing slot must have no further effect that the host would mind.
//
// Texts are NUL-terminated bytes. Those that the plug-in makes are ASCII; what it was given by the
// host comes back byte for byte. Percent signs in them mean nothing. Texts and buffers that are
// handed to a slot belong to the plug-in and are valid during the call; none of them is null.
//
// Exceptions must not leave a slot.
//
// Each slot ends with a tag: who implements it, and when the plug-in may call it.

#ifndef FLASH_CORVANE_IFLASHHOST_H
#define FLASH_CORVANE_IFLASHHOST_H

#include <stddef.h>
#include <stdint.h>

class IFlashHost {
  public:
    // Slot 0. Looks up a setting by its exact, case-sensitive name.
    // Returns the setting's value, or null when the host has no setting of that name. The text
    // must stay valid until the next call of any slot. The plug-in asks twice in a row for each
    // value: the first answer tells whether the setting exists, the second is used.
    // [host implements; any time after creation]
    virtual const char* GetProperty(const char* name) = 0;

    // Slot 1. Stores a setting: device information, the last checksum, a register read back.
    // name and value are valid during the call; a host that keeps them copies them.
    // [host implements; any time after creation]
    virtual const char* SetProperty(const char* name, const char* value) = 0;

    // Slot 2. Loads a program file into the halted target, ready for RunTarget to start it.
    // fileName is a file name without a directory; second is always the empty text; directory is
    // the text of GetDirectory with "..\..\merrow\" behind it, on every system. All three are valid
    // during the call. The host sets the program counter, and the stack pointer where the program
    // doesn't; the plug-in touches no register of the core. The host leaves 0 in the loader's two
    // status words, 0x2000100C and 0x2000101C, whatever RAM held before.
    // [host implements; during WriteDataToFlash]
    virtual const char* LoadProgram(const char* fileName, const char* second,
                                    const char* directory) = 0;

    // Slot 3. Keeps its place; takes nothing and does nothing.
    // [reserved; never called]
    virtual const char* Reserved3() = 0;

    // Slot 4. Lets the target run from where LoadProgram left its program counter. Returns at
    // once; the target runs on until HaltTarget or ResetTarget.
    // [host implements; during WriteDataToFlash]
    virtual const char* RunTarget() = 0;

    // Slot 5. Keeps its place; takes nothing and does nothing.
    // [reserved; never called]
    virtual const char* Reserved5() = 0;

    // Slot 6. Halts the target. Halting a halted target is a success.
    // [host implements; during CreateFlashDevice2 and any time after creation]
    virtual const char* HaltTarget() = 0;

    // Slot 7. Resets the target and leaves it halted. flag is false for a reset after an erase
    // and for a device of the Ravik class, true for the reset of any other class before a load.
    // [host implements; any time after creation]
    virtual const char* ResetTarget(bool flag) = 0;

    // Slot 8. Keeps its place; takes nothing and does nothing.
    // [reserved; never called]
    virtual const char* Reserved8() = 0;

    // Slot 9. Keeps its place; takes nothing and does nothing.
    // [reserved; never called]
    virtual const char* Reserved9() = 0;

    // Slot 10. Reads count elements of width bytes each from the target into buffer.
    // buffer has room for count * width bytes and belongs to the plug-in. width is 1, 2 or 4.
    // address is a byte address in the target, below 2^32. page numbers the target's memory
    // space: 1 for registers and other single values, 0 for flash contents, and the page given to
    // WriteDataToFlash for the bytes around a section. What buffer holds after a failure is of no
    // interest. A register access (width 4) must reach the target as one access of that width. One
    // call reads at most 32752 bytes. The target may be running: it is as the host left it when
    // CreateFlashDevice2 first reads, and runs the loader during WriteDataToFlash.
    // [host implements; during CreateFlashDevice2 and any time after creation]
    virtual const char* ReadMemory(void* buffer, size_t count, uint64_t address, int16_t page,
                                   size_t width) = 0;

    // Slot 11. Writes count elements of width bytes each from buffer to the target. Arguments as
    // for ReadMemory. The bytes go out as they lie in buffer: a 32-bit value goes to the target
    // least significant byte first. Writes must reach the target in the order of the calls. One
    // call writes at most 2048 bytes; the target may be running the loader.
    // [host implements; any time after creation]
    virtual const char* WriteMemory(const void* buffer, size_t count, uint64_t address,
                                    int16_t page, size_t width) = 0;

    // Slot 12. Keeps its place; takes nothing and does nothing.
    // [reserved; never called]
    virtual const char* Reserved12() = 0;

    // Slot 13. Keeps its place; takes nothing and does nothing.
    // [reserved; never called]
    virtual const char* Reserved13() = 0;

    // Slot 14. Keeps its place; takes nothing and does nothing.
    // [reserved; never called]
    virtual const char* Reserved14() = 0;

    // Slot 15. Keeps its place; takes nothing and does nothing.
    // [reserved; never called]
    virtual const char* Reserved15() = 0;

    // Slot 16. Begins a progress display with a title, which is valid during the call. Only one
    // display is open at a time. When it fails, no display is open and EndProgress is not called.
    // [host implements; during WriteDataToFlash, PerformOperation and ResetSettings]
    virtual const char* BeginProgress(const char* title) = 0;

    // Slot 17. Reports how far the work of the open display has come, in percent (0 to 100), with
    // a short text, which is valid during the call. Over more than 40 MiB the percentage starts
    // again from a small number. An error text from here stops the work: the way to offer a cancel
    // button.
    // [host implements; while a progress display is open]
    virtual const char* UpdateProgress(uint32_t percent, const char* text) = 0;

    // Slot 18. Ends the open progress display. Called exactly once for each BeginProgress that
    // succeeded, whatever else fails, and not again when it fails itself.
    // [host implements; while a progress display is open]
    virtual const char* EndProgress() = 0;

    // Slot 19. Shows an error message to the user. text is valid during the call.
    // [host implements; any time after creation]
    virtual const char* ShowError(const char* text) = 0;

    // Slot 20. Shows an information message to the user. text is valid during the call.
    // [host implements; any time after creation]
    virtual const char* ShowMessage(const char* text) = 0;

    // Slot 21. Returns the directory below which the host finds its target-side programs, ending
    // in a path separator. Never null, and never an error text. The text must stay valid until
    // the next call of any slot.
    // [host implements; during WriteDataToFlash]
    virtual const char* GetDirectory() = 0;

    // Slot 22. Waits at least the given number of milliseconds while the target goes on. The
    // hardware needs these pauses; a host must not shorten them.
    // [host implements; any time after creation]
    virtual const char* Sleep(uint32_t milliseconds) = 0;

  protected:
    // The host owns its object; the plug-in never deletes it.
    ~IFlashHost() = default;
};

#endif
