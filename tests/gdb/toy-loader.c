// A flash loader for a board whose flash is RAM: it serves its two parameter blocks in turn, as the
// real one does, and "programs" by copying.

typedef volatile unsigned word;
void start(void) {
    word* blocks = (word*)0x20001000;
    blocks[3] = blocks[7] = 0;
    for (unsigned i = 0;; i ^= 1) {
        word* block = blocks + 4 * i;
        while (block[3] != 0xFFFFFFFF) {}
        volatile unsigned char* from = (volatile unsigned char*)(0x20000000 + 2048 * i);
        volatile unsigned char* to = (volatile unsigned char*)block[1];
        for (unsigned n = block[2]; n > 0; --n) *to++ = *from++;
        block[3] = 0;
    }
}
