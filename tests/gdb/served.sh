#!/usr/bin/env bash
# served.sh TOOL: the simulated device as a GDB server. The tool's own client must find it as it finds
# the device inside the process; stock GDB must be able to load, compare, read and leave it.
set -euo pipefail
# shellcheck source=tests/gdb/as-inside.sh
. "$(dirname "$0")/as-inside.sh"
server=
trap 'kill $server 2>/dev/null || true; rm -rf "$work"' EXIT
require gdb-multiarch
build_loader
sim=quen,erase-time=1ms,chunk-time=1ms

CORVANE_SIM=$sim CORVANE_SIM_FILE=served.sim CORVANE_GDB=:1 timeout 300 "$tool" -q serve 0 >listening 2>refused &
server=$!
port=$(await listening 's/.*:\([0-9]*\);.*/\1/p')
as_inside "$sim" "$port" 70000 || { cat refused; exit 1; }
[ ! -s refused ] || { cat refused; exit 1; }

gdb-multiarch -nx -batch -ex 'set confirm off' -ex "target remote :$port" -ex load \
    -ex compare-sections -ex 'x/1wx 0x400fe000' -ex 'dump memory dumped 0x8000 0x10000' \
    -ex 'hbreak *0x100' -ex 'python print(len(gdb.selected_inferior().read_memory(0, 40000)))' \
    -ex 'stepi' -ex 'step' -ex 'monitor halt' -ex 'info registers pc' \
    -ex 'monitor reset halt' -ex 'x/2wx 0' -ex detach "$elf" >gdb 2>&1 || { cat gdb; exit 1; }
for expected in 'Transfer rate' 'matched' '0x400fe000:.*0x10050000' '^pc ' '^40000' 'detached'; do
    grep -q "$expected" gdb || { echo "no '$expected'"; cat gdb refused; exit 1; }
done
if grep -i 'mis-matched\|error' gdb; then exit 1; fi

# Wrong options, nobody there, a server that hangs, and Ctrl-C while it does.
expect 2 'no HOST:PORT' --gdb nonsense info
expect 2 'give one of them' --gdb ":$port" --sim quen info
expect 2 'pc takes a number' --gdb ":$port" --gdb-option pc=x info
expect 4 'refused; is it running' --gdb :1 info
expect 3 'nowhere.out can.t be opened: No such file' --gdb ":$port" --loader nowhere.out program "$elf" --rewrite
mkfifo pipe.out
expect 3 'pipe.out is no regular file' --gdb ":$port" --loader pipe.out program "$elf" --rewrite
CORVANE_SIM=velk expect 0 'Quen' --gdb ":$port" info
CORVANE_GDB=:1 expect 0 'Velk\|none' --sim velk info
hanging=$(cat "/proc/$server/task/$server/children")
kill -STOP $hanging
expect 4 'no packet within 0.3 s' --gdb ":$port" --gdb-option timeout=300ms info
"$tool" --gdb ":$port" --gdb-option timeout=60s info >said 2>&1 </dev/null &
client=$!
sleep 0.5
kill -INT "$client"
status=0
wait "$client" || status=$?
kill -CONT $hanging
[ "$status" = 130 ] || { echo "Ctrl-C -> $status"; cat said; exit 1; }

kill "$server"
wait "$server" || { echo "the server ended with $?"; exit 1; }
server=
"$tool" --sim-file served.sim verify "$elf"

# A client that has gone leaves contents that can't be kept.
CORVANE_SIM=$sim timeout 300 "$tool" --sim-file gone/served.sim serve 0 >listening 2>refused &
server=$!
port=$(await listening 's/.*:\([0-9]*\);.*/\1/p')
expect 0 '' --gdb ":$port" info
kill "$server"
status=0
wait "$server" || status=$?
server=
[ "$status" = 3 ] || { echo "unkept contents -> $status"; cat refused; exit 1; }

# A server that drives another device.
for registers in ones zeros; do
    timeout 300 "$tool" --sim "quen,registers=$registers" serve 0 >listening 2>refused &
    server=$!
    port=$(await listening 's/.*:\([0-9]*\);.*/\1/p')
    expect 4 'the server answers, but its target (architecture arm' --gdb ":$port" info
    if grep -e --sim said; then exit 1; fi
    kill "$server"
    wait "$server"
    server=
    : >listening
done
