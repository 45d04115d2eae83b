@ A small firmware for any Cortex-M3: it takes the CRC-32 of its own image over and over, once a second,
@ and says through the trace port whether the image is still what it was at the start. It is written in
@ assembly language, so that every version of the tools makes the same bytes of it.

    .syntax unified
    .cpu    cortex-m3
    .thumb

    .equ    ticksPerSecond, 100
    .equ    sysTick,        0xE000E010      @ control, reload, current
    .equ    tracePort,      0xE0000000      @ reads as 1 when it can take a byte

    .macro  function name
    .global \name
    .type   \name, %function
    .thumb_func
\name:
    .endm

    .section .vectors, "a"
    .word   stackTop, Reset
    .rept   13
    .word   Halt
    .endr
    .word   Tick

    .text
    function Reset
    ldr     r0, =dataStart                  @ variables with a value
    ldr     r1, =dataEnd
    ldr     r2, =dataImage
1:  cmp     r0, r1
    ittt    lo
    ldrlo   r3, [r2], #4
    strlo   r3, [r0], #4
    blo     1b
    ldr     r1, =bssEnd                     @ and those without
    movs    r3, #0
2:  cmp     r0, r1
    itt     lo
    strlo   r3, [r0], #4
    blo     2b

    bl      ImageChecksum
    ldr     r1, =checksumAtStart
    str     r0, [r1]
    ldr     r0, =greeting
    bl      Say
    ldr     r0, =sysTick
    ldr     r1, =clockInHertz
    ldr     r1, [r1]
    movs    r2, #ticksPerSecond
    udiv    r1, r1, r2
    subs    r1, #1
    str     r1, [r0, #4]
    movs    r1, #7                          @ the core's clock, with an interrupt
    str     r1, [r0]

WaitForSecond:
    wfi
    ldr     r0, =ticks
    ldr     r1, [r0]
    cmp     r1, #ticksPerSecond
    blo     WaitForSecond
    movs    r1, #0
    str     r1, [r0]
    bl      ImageChecksum
    ldr     r1, =checksumAtStart
    ldr     r1, [r1]
    cmp     r0, r1
    ite     eq
    ldreq   r0, =unchanged
    ldrne   r0, =changed
    bl      Say
    b       WaitForSecond

    function Tick
    ldr     r0, =ticks
    ldr     r1, [r0]
    adds    r1, #1
    str     r1, [r0]
    bx      lr

    function Halt
    b       Halt

@ r0: the CRC-32 of the image, which is whole words, four bytes at a time.
    function ImageChecksum
    push    {r4, r5, lr}
    movs    r1, #0
    ldr     r2, =imageEnd
    ldr     r3, =crcTables
    mov     r0, #-1
1:  ldr     r4, [r1], #4
    eors    r4, r0
    lsrs    r5, r4, #24
    ldr     r0, [r3, r5, lsl #2]
    ubfx    r5, r4, #16, #8
    add     r5, r5, #256
    ldr     r5, [r3, r5, lsl #2]
    eors    r0, r5
    ubfx    r5, r4, #8, #8
    add     r5, r5, #512
    ldr     r5, [r3, r5, lsl #2]
    eors    r0, r5
    uxtb    r5, r4
    add     r5, r5, #768
    ldr     r5, [r3, r5, lsl #2]
    eors    r0, r5
    cmp     r1, r2
    blo     1b
    mvns    r0, r0
    pop     {r4, r5, pc}

@ Sends the text at r0, which ends with a zero. A byte that the port doesn't take in time is left out,
@ which is all of them when no debugger has switched it on.
    function Say
    ldr     r1, =tracePort
1:  ldrb    r2, [r0], #1
    cbz     r2, 4f
    mov     r3, #1000
2:  ldr     r12, [r1]
    cmp     r12, #0
    bne     3f
    subs    r3, #1
    bne     2b
    b       1b
3:  strb    r2, [r1]
    b       1b
4:  bx      lr

    .ltorg

@ Table k has what byte i does to the checksum when k more bytes follow it.
    .section .rodata
    .balign 4
crcTables:
    .set    steps, 8
    .rept   4
    .set    byte, 0
    .rept   256
    .set    crc, byte
    .rept   steps
    .if     crc & 1
    .set    crc, (crc >> 1) ^ 0xEDB88320
    .else
    .set    crc, crc >> 1
    .endif
    .endr
    .word   crc
    .set    byte, byte + 1
    .endr
    .set    steps, steps + 8
    .endr

greeting:  .asciz "A firmware that watches over its own image\n"
unchanged: .asciz "The image is what it was at the start\n"
changed:   .asciz "The image has changed since the start\n"

    .data
clockInHertz:
    .word   16000000

    .bss
    .global checksumAtStart
checksumAtStart:
    .space  4
ticks:
    .space  4
