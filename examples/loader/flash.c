/* How 128 bytes get into flash. This is the part that you write: it drives your flash controller.
 *
 * As it stands it works where flash takes stores like RAM does, as on QEMU's boards. On real flash
 * such stores are lost or end in a fault.
 *
 * The plug-in has erased the sector before, and has set up clocks and flash timing where the device
 * wants that. Interrupts are off. There is no C library. Take your time: the plug-in waits
 * "FlashTimeoutValue" seconds for all chunks of a section together.
 */

#include "loader.h"

uint32_t ProgramBlock(uint32_t address, const uint32_t words[WordsPerBlock]) {
    volatile uint32_t* flash = (volatile uint32_t*)(uintptr_t)address;
    for (int i = 0; i < WordsPerBlock; ++i)
        flash[i] = words[i];
    for (int i = 0; i < WordsPerBlock; ++i)
        if (flash[i] != words[i]) return 1;
    return 0;
}
