# shellcheck shell=bash
# Sourced with the tool as the first argument: a place to work in, a list of servers that end with the
# script, and the commands that must find a device behind a GDB server as they find it inside the process.

tool=$1
servers=()
trap 'kill "${servers[@]}" 2>/dev/null || true; rm -rf "$work"' EXIT

firmware=$(cd "$(dirname "${BASH_SOURCE[0]}")/../../examples/firmware" && pwd)
work=$(mktemp -d)
cd "$work"
export XDG_CONFIG_HOME=$work XDG_STATE_HOME=$work
"$firmware/build.sh" "$work"
elf=firmware.elf

require() {
    local program
    for program in "$@"; do
        command -v "$program" >/dev/null || { echo "$program is missing"; exit 1; }
    done
}

# What is started in the simulated RAM is the loader, whatever it is.
build_loader() {
    require clang ld.lld
    echo '.globl _start; _start: b _start' |
        clang --target=armv7m-none-eabi -mthumb -nostdlib -fuse-ld=lld -Wl,-N,-Ttext=0x20002000 \
            -x assembler - -o loader.out
}

# await FILE SED-PROGRAM: what it finds in the file, once it does.
await() {
    local found=
    for _ in $(seq 200); do
        found=$(sed -n "$2" "$1" 2>/dev/null || true)
        [ -z "$found" ] || break
        sleep 0.05
    done
    echo "$found"
}

# expect STATUS WORDS COMMAND...: what the tool ends with (a pattern), and says.
expect() {
    local wanted=$1 words=$2 status=0
    shift 2
    timeout 60 "$tool" "$@" >said 2>&1 </dev/null || status=$?
    # shellcheck disable=SC2053
    [[ $status == $wanted ]] && { [ -z "$words" ] || grep -q -- "$words" said; } || { echo "$* -> $status"; cat said; exit 1; }
}

# Times are nobody's business here, nor how a server compares, and it's known which device is which.
run() {
    local status=0
    "$tool" "$@" 2>&1 </dev/null | sed -E '/^(Simulated|Board at) /d; s/, by CRC-32$//; s/ +in (under )?[0-9.:]+( ?m?s)?.*$//' || status=$?
    echo "status $status"
}

# as_inside SIM PORT LARGE: the same on a device inside and behind that port, the files that are
# written included; LARGE is the size of an image in bytes.
as_inside() {
    head -c "$3" /dev/urandom >large.bin
    rm -f inside outside
    while read -r line; do
        echo "\$ $line" | tee -a inside >>outside
        # shellcheck disable=SC2086
        run --sim "$1" --sim-file inside.sim $line >>inside
        # shellcheck disable=SC2086
        run --gdb ":$2" --loader loader.out $line >>outside
    done <<END
info
program $elf --crc --blank-check
verify $elf
program large.bin --base 10003 --run
verify large.bin --base 10003
read - --range 10000-1007f --format srec
checksum --range 0-fff
checksum --of $elf
mac program 02-1B-C3-04-05-06 --commit
mac read
register program 0 12ab --commit
register read 0
erase --range 0-fff
verify $elf
blank-check --range 0-fff
blank-check
reset --run
erase
program nowhere.elf
END
    diff inside outside
}
