#!/usr/bin/env bash
# debuggers.sh TOOL REGISTER-LENDER: stock GDB and LLDB load through the tool, which adds flash to a probe's GDB server:
# here the one of the simulated device, whose own flash packets never pass.
set -euo pipefail
lender=$2
# shellcheck source=tests/gdb/as-inside.sh
. "$(dirname "$0")/as-inside.sh"
require gdb-multiarch lldb arm-none-eabi-as qemu-system-arm
build_loader

# serve NAME OPTION...: a server, whose port is $port then.
serve() {
    timeout 300 "$tool" "${@:2}" serve 0 >"$1.listening" 2>"$1.refused" &
    servers+=($!)
    port=$(await "$1.listening" 's/.*:\([0-9]*\);.*/\1/p')
}

# In RAM where the loader works, in flash at odd addresses, and far beyond one batch.
head -c 110003 /dev/urandom >large.bin
head -c 3001 /dev/urandom >small.bin
cat >image.s <<END
.section .first, "a"; .incbin "small.bin"
.section .large, "a"; .incbin "large.bin"
.section .ram, "aw"; .incbin "small.bin"
END
arm-none-eabi-as image.s -o image.o
arm-none-eabi-ld -e 0x103 -Ttext=0 --section-start=.first=0x103 --section-start=.large=0x1107 \
    --section-start=.ram=0x20000ff1 image.o -o image.elf

serve board --sim quen,flash=256K,erase-time=1ms,chunk-time=1ms --sim-file board.sim
board=$port
serve probe --gdb ":$board" --loader loader.out
fill=$(printf 'set {unsigned}(0x20000000+%d)=%d\n' 0 1 4092 2 4096 3 8192 4 65532 5)
state() { echo "info registers"; echo "dump memory $1 0x20000000 0x20010000"; }
cat >load.gdb <<END
target remote :$port
$fill
set \$r0=1
set \$r7=0x12345678
set \$lr=0x101
$(state before)
load firmware.elf
$(state after)
load image.elf
monitor corvane
load image.elf
monitor corvane
compare-sections
detach
END
timeout 100 gdb-multiarch -nx -batch -ex 'set confirm off' -x load.gdb image.elf >gdb 2>&1 || { cat gdb probe.refused; exit 1; }
cmp before after
says() {
    local file=$1 words
    shift
    for words in "$@"; do
        grep -q -- "$words" "$file" || { echo "no '$words'"; cat "$file" probe.refused; exit 1; }
    done
}
says gdb '110.4 KiB in 112 sectors, 0 bytes of it' '110.4 KiB in 112 sectors, 110.4 KiB of it' \
    '.first.*: matched' '.large.*: matched' '.ram.*: matched' detached
[ "$(grep -c '^r7 *0x12345678' gdb)/$(grep -c '^lr *0x101' gdb)" = 2/2 ] || { echo registers; cat gdb; exit 1; }

# By MI, as in an IDE.
printf '%s\n' "-target-select remote :$port" -target-download -gdb-exit |
    timeout 60 gdb-multiarch -nx -q --interpreter=mi2 firmware.elf >mi 2>&1
says mi '^+download,{section=".data"' '^^done,address="0x'

# By LLDB, which writes RAM before it says that the flash is done.
timeout 60 lldb -x -b -o "gdb-remote 127.0.0.1:$port" -o 'register write r7 0x1234567' \
    -o 'target modules load --file image.elf --load --slide 0' -o 'register read r7' \
    -o 'memory read --force -b --outfile held.bin 0x20000ff0 0x20001baa' \
    -o 'process plugin packet monitor corvane' -o detach image.elf >lldb 2>&1 || { cat lldb; exit 1; }
says lldb 'r7 = 0x01234567' 'compared: 11[01].[0-9] KiB in 112 sectors' detached
tail -c +2 held.bin | cmp small.bin -  # newer ones make each address even
if grep -v '^Board at ' probe.refused; then exit 1; fi

# The other one is told; the next one is served when one has gone, in the middle of a load even. What
# was begun is said.
exec 3<>"/dev/tcp/127.0.0.1/$port"
printf '+$QStartNoAckMode#b0+$vFlashErase:0,400#7e$vFlashWrite:0:abc#39' >&3
expect 4 'serves another client' --gdb ":$port" info
exec 3<&-
expect 0 Quen --gdb ":$port" info
says probe.refused 'left in the middle of a load: 0 bytes in 0 sectors were programmed.* 1 sector more'

# Whoever asks for the probe finds out what it is; the loader is looked at first.
expect 3 'nowhere.out can.t be opened' serve 0 --gdb ":$board" --loader nowhere.out
expect 2 'give one of them' serve 0 --gdb ":$board" --sim quen
serve nobody --gdb :1
timeout 60 gdb-multiarch -nx -batch -ex "target remote :$port" >gdb 2>&1 || true
says nobody.refused 'refused; is it running'
says gdb 'can.t connect to the GDB server at localhost:1'

# On QEMU, where loader and firmware run: the example's loader programs, and the debugger then has its
# breakpoints, steps and Ctrl-C.
# Newer ones don't let a debugger put PRIMASK back, so that this loader leaves it alone.
cp -r "$firmware/../loader" toy
sed -i '/cpsid i/d' toy/startup.c
ARM_CC='clang --target=arm-none-eabi -fuse-ld=lld' sh toy/build.sh "$work/toy.out"
board=$((20000 + RANDOM % 10000))
timeout 200 qemu-system-arm -M mps2-an385 -S -display none -serial none -monitor none \
    -gdb "tcp:127.0.0.1:$board" >qemu 2>&1 &
emulator=$!
sleep 1
# lend NAME: a server behind it.
lend() {
    timeout 200 "$lender" "$board" >"$1.lent" 2>&1 &
    serve "$1" --gdb ":$(await "$1.lent" 1p)" --loader toy.out --gdb-option server=qemu
}
lend qemu
registers=$(printf '%s\n' 'echo <' 'info registers' 'x/2wx 0x20000010' 'echo >')
cat >qemu.gdb <<END
target remote :$port
set {int}0x20000010=0x1234
set \$r7=77
$registers
file image.elf
load
load
monitor corvane
compare-sections
file firmware.elf
set breakpoint always-inserted on
hbreak Tick
load
$registers
monitor system_reset
maintenance flush register-cache
continue
stepi
delete
python import threading,os,signal; threading.Timer(2,lambda: os.kill(os.getpid(),signal.SIGINT)).start()
continue
load
monitor corvane
detach
END
timeout --foreground 100 gdb-multiarch -nx -batch -x qemu.gdb firmware.elf >gdb 2>&1 || { cat gdb qemu.refused; exit 1; }
lend again
echo '.incbin "large.bin"' | arm-none-eabi-as -o beside.o -
arm-none-eabi-ld -N -e 0x41 -Ttext=0x8001 beside.o -o beside.elf  # the firmware runs on
timeout 60 lldb -x -b -o "gdb-remote 127.0.0.1:$port" -o 'register write r7 0x1234567' \
    -o 'target modules load --file beside.elf --load --slide 0' -o 'register read r7' \
    -o 'process plugin packet monitor corvane' -o detach beside.elf >lldb 2>&1 || { cat lldb; exit 1; }
kill $emulator
says lldb 'r7 = 0x01234567' 'compared: 107.[0-9] KiB in 108 sectors' detached
says gdb '^r7 *0x4d' '0x20000010:.0x00001234' '110.4 KiB in 112 sectors, 110.4 KiB of it' '.large.*: matched' \
    '.ram.*: matched' 'Breakpoint.*Tick ()' '^0x000000ae in Tick' \
    'received signal SIGINT' '4.5 KiB of it left alone'
[ -z "$(sed -n '/^</,/^>/ { /^>\|^pc \|^xpsr /d; s/^<//; p; }' gdb | sort | uniq -u)" ] || { cat gdb; exit 1; }

kill "${servers[@]}"
wait "${servers[@]}" || { echo "a server ended with $?"; exit 1; }
servers=()
expect 0 'holds the image' --sim-file board.sim verify large.bin --base 1107
