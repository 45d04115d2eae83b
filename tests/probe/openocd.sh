#!/usr/bin/env bash
# openocd.sh TOOL PROBE-MODEL: the tool through a stock probe server, OpenOCD, which drives the pins of
# a modelled debug port in front of the simulated device; then with faults of target and cable. What the
# tool says is held against what the device's file holds afterwards.
set -euo pipefail
tool=$1
model=$2
here=$(cd "$(dirname "$0")" && pwd)
board=
server=
trap 'kill $server $board 2>/dev/null || true; rm -rf "$work"' EXIT
# shellcheck source=tests/gdb/as-inside.sh
. "$here/../gdb/as-inside.sh"
require openocd
build_loader
sim=quen,flash=128K,erase-time=1ms,chunk-time=1ms

# attach [FAULT...]: a board with these faults, and a server that has found it. The file keeps what the
# last board held.
attach() {
    timeout 200 "$model" "$sim" board.sim "$@" >pins 2>refused &
    board=$!
    : >log
    timeout 200 openocd -c "set PORT $(await pins 1p)" -f "$here/openocd.cfg" >log 2>&1 &
    server=$!
    port=$(await log 's/.*Listening on port \([0-9]*\) for gdb.*/\1/p')
    [ -n "$port" ] || { echo "OpenOCD found no board"; cat log refused; exit 1; }
}

# leave STATE: the server ends, and has left the core so.
leave() {
    kill "$server"
    wait "$server" || true
    wait "$board" || { echo "the model failed"; cat refused; exit 1; }
    server='' board=''
    [ "$(tail -1 pins)" = "$1" ] || { echo "left $(tail -1 pins), not $1"; cat log; exit 1; }
}

gdb() { # STATUS WORDS COMMAND...
    local status=$1 words=$2
    shift 2
    expect "$status" "$words" --gdb ":$port" --loader loader.out "$@"
}

attach
as_inside "$sim" "$port" 15000
leave halted
expect 0 'holds the image' --sim-file board.sim verify large.bin --base 10003

# The cable comes off, and is put back for the next command.
cut() { # WORD:ACCESS STATUS WORDS COMMAND...
    local where=$1
    shift
    attach "cable-off=$where"
    gdb "$@"
    leave halted
}
held() { expect 0 Read --sim-file board.sim read "$1" --range 0-1ffff --force; }
held before.bin
cut 4000:1 1 'reading flash at 0x0' read out.bin --range 0-7fff
[ ! -e out.bin ]
cut 400ae2c0:1 1 'the flash is as it was' program large.bin --base 0
cut 400fd008:1 1 'the flash is incomplete: 0 bytes erased' program large.bin --base 0
held after.bin
cmp before.bin after.bin
cut 20000000:2 1 'the flash is incomplete: 15 KiB erased, [24] KiB of' program large.bin --base 0
attach
gdb 0 'Done: the flash holds the image' program large.bin --base 0
leave halted
expect 0 'holds the image' --sim-file board.sim verify large.bin --base 0
