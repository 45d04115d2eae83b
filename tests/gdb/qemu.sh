#!/usr/bin/env bash
# qemu.sh TOOL REGISTER-LENDER: the tool against a server and a core that are nobody's here. QEMU executes
# the example of a loader, by which a generic board with RAM where the flash would be is programmed.
set -euo pipefail
lender=$2
# shellcheck source=tests/gdb/as-inside.sh
. "$(dirname "$0")/as-inside.sh"
require clang ld.lld qemu-system-arm
head -c 21581 /dev/urandom >image.bin

# By GCC, too, where there is one for ARM.
for compiler in 'clang --target=arm-none-eabi -fuse-ld=lld' arm-none-eabi-gcc; do
    command -v "${compiler%% *}" >/dev/null || continue
    ARM_CC="$compiler -Wpedantic -Werror" sh "$firmware/../loader/build.sh" loader.out
    board=$((20000 + RANDOM % 10000))
    timeout 120 qemu-system-arm -M mps2-an385 -S -display none -serial none -monitor none \
        -gdb "tcp:127.0.0.1:$board" >qemu 2>&1 &
    servers+=($!)
    sleep 1
    rm -f lent
    timeout 120 "$lender" "$board" >lent 2>&1 &
    servers+=($!)
    expect 0 'Done: the flash holds the image' --gdb ":$(await lent 1p)" --loader loader.out \
        --gdb-option server=qemu program image.bin --base 1083
done
