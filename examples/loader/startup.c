/* What has to be done before C code runs. The debugger has set the program counter to Start and
 * nothing else that can be relied on: the core is as the last program, or a reset, has left it. */

#include "loader.h"

/* Set by loader.ld. */
extern uint32_t stack_top[], bss_start[], bss_end[];

void StartInC(void) {
    for (volatile uint32_t* word = bss_start; word != bss_end; ++word)
        *word = 0;
    ServeChunks();
}

__attribute__((naked, section(".start"))) void Start(void) {
    __asm__ volatile(
        "cpsid i\n"     /* no interrupt of the last program */
        "movs r0, #0\n" /* the main stack, in privileged mode */
        "msr control, r0\n"
        "isb\n"
        "ldr r0, =stack_top\n"
        "mov sp, r0\n"
        "bl StartInC\n" /* doesn't return */
        ".ltorg\n");
}
