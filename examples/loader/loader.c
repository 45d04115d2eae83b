/* The target's side of the handshake with the plug-in.
 *
 * Each of the two parameter blocks belongs to one side at a time, together with its buffer:
 *
 *     status is 0xFFFFFFFF   the loader's: there is a chunk to program
 *     any other status       the plug-in's: it may write the next chunk
 *
 * The loader gives a block back by writing its status, and only then. The plug-in hands the blocks
 * over in turn, block 0 first. So the loader waits for one at a time, in the same order.
 */

#include "loader.h"

enum { BytesPerChunk = 2048, BadChunk = 0xBAD, Failed = 0xFA11 };

static const uint32_t ToDo = 0xFFFFFFFF;

struct ParameterBlock {
    uint32_t
        own; /* the plug-in leaves it alone: where the loader is, for whoever looks for a hang */
    uint32_t address;
    uint32_t byteCount;
    uint32_t status;
};

/* At 0x20001000. These zeros are part of the file, so loading it marks both blocks as done. The
 * loader can't do that itself: the first chunk may be there before its first instruction runs. */
__attribute__((section(".blocks"))) volatile struct ParameterBlock blocks[2] = {{0}, {0}};

/* At 0x20000000; see loader.ld. Not in the file: nothing need be there. */
extern uint32_t buffers[2][BytesPerChunk / 4];

static uint32_t ProgramChunk(volatile struct ParameterBlock* block, const uint32_t* words) {
    const uint32_t start = block->address;
    const uint32_t byteCount = block->byteCount;
    if (start % BytesPerBlock != 0 || byteCount % BytesPerBlock != 0 || byteCount > BytesPerChunk)
        return BadChunk;
    for (uint32_t done = 0; done < byteCount; done += BytesPerBlock) {
        block->own = start + done;
        const uint32_t failure = ProgramBlock(start + done, words + done / 4);
        if (failure != 0) return failure == ToDo ? Failed : failure;
    }
    return 0;
}

void ServeChunks(void) {
    for (unsigned turn = 0;; turn ^= 1) {
        volatile struct ParameterBlock* block = &blocks[turn];
        while (block->status != ToDo) {
        }
        __asm__ volatile("dmb" ::: "memory"); /* read the buffer after the status */
        const uint32_t status = ProgramChunk(block, buffers[turn]);
        __asm__ volatile("dsb" ::: "memory"); /* all that was written comes before the status */
        block->status = status;
    }
}
