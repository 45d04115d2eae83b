# Plays the plug-in: hands one chunk to the loader, on a board of QEMU's that has RAM where flash
# would be, and shows what became of it.
#
#     gdb-multiarch -batch -x try.gdb FlashLoaderMerrow.out

target remote | qemu-system-arm -M mps2-an385 -S -display none -serial none -monitor none -gdb stdio
load
set {unsigned}0x20000000 = 0x12345678
set {unsigned[4]}0x20001000 = {0, 0x1000, 128, 0xffffffff}
watch *(unsigned*)0x2000100c
continue
printf "status 0x%x, flash at 0x1000 holds 0x%x\n", *(unsigned*)0x2000100c, *(unsigned*)0x1000

# QEMU would go on when GDB has left, and GDB would wait for it. It ends before it answers.
python
try:
    gdb.execute("kill")
except gdb.error:
    pass
end
