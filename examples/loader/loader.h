/* What the three sources of the loader share. */

#ifndef LOADER_H
#define LOADER_H

#include <stdint.h>

enum { BytesPerBlock = 128, WordsPerBlock = BytesPerBlock / 4 };

/* flash.c, the one function to fill in: programs 128 bytes to `address`, which is a multiple of
 * 128, and returns when they are in flash: 0, or a number of your choice that says what went wrong.
 */
uint32_t ProgramBlock(uint32_t address, const uint32_t words[WordsPerBlock]);

/* loader.c: serves the plug-in for good. */
void ServeChunks(void);

#endif
