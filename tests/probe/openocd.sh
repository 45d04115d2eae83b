#!/usr/bin/env bash
# openocd.sh TOOL PROBE-MODEL: the tool through a stock probe server, OpenOCD, which drives the pins of
# a modelled debug port in front of the simulated device; then with faults of target and cable. What the
# tool says is held against what the device's file holds afterwards.
set -euo pipefail
model=$2
here=$(cd "$(dirname "$0")" && pwd)
# shellcheck source=tests/gdb/as-inside.sh
. "$here/../gdb/as-inside.sh"
board='' server=''
trap 'kill $server $board 2>/dev/null || true; rm -rf "$work"' EXIT
require openocd gdb-multiarch lldb arm-none-eabi-as
build_loader
sim=quen,flash=128K,erase-time=1ms,chunk-time=1ms

# attach [FAULT...]: a board with these faults, and a server that has found it. The file keeps what the
# last board held. OpenOCD hides failed reads unless it is told not to.
attach() {
    : >pins  # the last board's port would be found in it
    timeout 200 "$model" "$sim" board.sim "$@" >pins 2>refused &
    board=$!
    : >log
    timeout 200 openocd -c "set PORT $(await pins 1p)" -c "gdb_report_data_abort $failed_reads" \
        -f "$here/openocd.cfg" >log 2>&1 &
    server=$!
    port=$(await log 's/.*Listening on port \([0-9]*\) for gdb.*/\1/p')
    [ -n "$port" ] || { echo "OpenOCD found no board"; cat log refused; exit 1; }
}
failed_reads=enable

# leave STATE...: the server ends, and has left the core in one of these.
leave() {
    kill "$server"
    wait "$server" || true
    wait "$board" || { echo "the model failed"; cat refused; exit 1; }
    server='' board=''
    [[ " $* " == *" $(tail -1 pins) "* ]] || { echo "left $(tail -1 pins), not $*"; cat said log; exit 1; }
}

# through FAULT STATUS LEFT WORDS COMMAND...: one command to a board with this fault.
through() {
    # shellcheck disable=SC2086
    attach $1
    expect "$2" "$4" --gdb ":$port" --loader loader.out "${@:5}"
    # shellcheck disable=SC2086
    leave $3
}

# What the device holds, in a file of that name.
held() {
    expect 0 Read --sim-file board.sim read "$1" --range 0-1ffff --force
    for number in 0 1; do
        expect 0 '' --sim-file board.sim register read $number
        cat said >>"$1"
    done
}

# as_it_was FAULT STATUS LEFT WORDS COMMAND...: and nothing in the device has changed.
as_it_was() {
    held before.bin
    through "$@"
    held after.bin
    cmp before.bin after.bin
}

attach
as_inside "$sim" "$port" 15000
# The last of these lets it run from erased vectors; OpenOCD halts it when it comes to see that.
leave halted 'locked up'
expect 0 'holds the image' --sim-file board.sim verify large.bin --base 10003

# An image with vectors, so that the core runs from reset.
{ printf '\0\0\1\x20\1\1\0\0\3\1\0\0\5\1\0\0'; head -c 14640 large.bin; } >image.bin
load='program image.bin --base 0'
any='halted running'

# shellcheck disable=SC2086
{
# The cable comes off.
as_it_was cable-off=4000:1 1 "$any" 'reading flash at 0x0' read out.bin --range 0-7fff
[ ! -e out.bin ]
as_it_was cable-off=400ae2c0:1 1 "$any" 'the flash is as it was' $load
as_it_was cable-off=400fd008:1 1 "$any" 'the flash is incomplete: 0 bytes erased' $load
through cable-off=20000000:2 1 "$any" 'the flash is incomplete: 15 KiB erased, [24] KiB of' $load
held half.bin
cmp -n 2048 image.bin half.bin
through '' 0 halted 'Done: the flash holds the image' $load

# Stock GDB loads through OpenOCD with flash added, and finds the core as it was but for pc.
attach
"$tool" serve 0 --gdb ":$port" --loader loader.out >listening 2>refused &
adder=$!
state=$(printf '%s\n' 'echo <' 'info registers' 'x/3wx 0x20000ffc' 'echo >')
cat >load.gdb <<END
target remote :$(await listening 's/.*:\([0-9]*\);.*/\1/p')
set {int}0x20001000=7
set \$r5=0x5555
$state
load
$state
compare-sections
detach
END
timeout 90 gdb-multiarch -nx -batch -x load.gdb "$elf" >gdb 2>&1
echo '.incbin "half.bin", 0, 3000' | arm-none-eabi-as -o half.o -
arm-none-eabi-ld -N -e 0x9003 -Ttext=0x9003 half.o -o half.elf
timeout 90 lldb -x -b -o "gdb-remote 127.0.0.1:$(await listening 's/.*:\([0-9]*\);.*/\1/p')" \
    -o 'register write r5 0x6666' -o 'target modules load --file half.elf --load --slide 0' \
    -o 'register read r5' -o 'process plugin packet monitor corvane' half.elf >lldb 2>&1 || { cat lldb refused; exit 1; }
grep -q 'compared: .*, 0 bytes of it left' lldb && grep -q 'r5 = 0x00006666' lldb || { cat lldb refused; exit 1; }
kill $adder
wait $adder
leave halted running
[ "$(grep -c 'matched' gdb)/$(grep -c '^r5 *0x5555' gdb)" = 2/2 ] &&
    [ -z "$(sed -n '/^</,/^>/ { /^>\|^pc /d; s/^<//; p; }' gdb | sort | uniq -u)" ] || { cat gdb refused; exit 1; }

# The core resets slowly, begins in the wrong state where the vectors are zero, can't be halted, and
# crashes: into lockup while the vectors are erased, into the image's endless handler, or into a catch.
through '' 0 running '' reset --run
through '' 0 running '' reset --run --gdb-option detach=yes
through '' 0 halted Quen info --gdb-option detach=yes
through reset-time=700 0 halted 'Done' $load --rewrite
as_it_was never-halts '[14]' running halt program large.bin --base 8000
as_it_was never-halts '[14]' running halt mac program 02-1B-C3-04-05-07 --commit
through crash-after=20 1 halted 'timed out' program large.bin --base 8000 --set FlashTimeoutValue=1
through crash-after=0 1 halted 'stopped by itself.*0x[0-9a-fA-F]' program large.bin --base 8000 --rewrite \
    --gdb-option 'init=cortex_m vector_catch hard_err'
for crash in 0 20; do
    through crash-after=$crash 1 halted 'stopped by itself.*0x[fF]\{7\}[eE]' $load --rewrite
done
head -c 2048 /dev/zero >zeros.bin
through '' 0 halted 'Done' program zeros.bin --base 0
through '' 0 halted 'Done' $load

# Ctrl-C as the loader works.
attach
"$tool" --gdb ":$port" --loader loader.out --trace steps --force $load --rewrite >said 2>&1 </dev/null &
client=$!
[ -n "$(await steps 's/.*WriteMemory 0x20000000.*/written/p')" ] || { echo "no chunk"; cat said; exit 1; }
kill -INT "$client"
interrupted=0
wait "$client" || interrupted=$?
[ "$interrupted" = 130 ] && grep -q 'interrupted; the flash is incomplete: 15 KiB erased' said ||
    { echo "Ctrl-C -> $interrupted"; cat said; exit 1; }
leave halted
through '' 0 halted 'Done' $load

# What a load needs is found out before one.
as_it_was '' 0 halted 'Done: a load can work' check
as_it_was never-halts 4 running 'FAIL *attach .*still runs' check
as_it_was crash-after=0 4 halted "FAIL *run .*outside the RAM: it crashed" check
as_it_was cable-off=20000008:9 4 "$any" 'FAIL *memory ' check

# Failed reads are hidden: nobody works like that unless the user says so.
failed_reads=disable
as_it_was '' 4 halted 'gdb_report_data_abort enable' verify image.bin --base 0
as_it_was '' 4 halted 'FAIL *failed reads *hidden' check
trusted='--gdb-option reads=trusted'
as_it_was '' 0 halted 'note *failed reads *hidden' check $trusted
through '' 0 halted 'Done' $load --rewrite $trusted
gone='identification register reads 0x00000000, not'
as_it_was cable-off=4000:1 4 "$any" "$gone" read out.bin --range 0-7fff $trusted
[ ! -e out.bin ]
as_it_was cable-off=800:1 4 "$any" "$gone" verify image.bin --base 0 $trusted
}
