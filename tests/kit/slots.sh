#!/usr/bin/env bash
# Compares the slots that compilers of both C++ ABIs give the interfaces, and the numbers and tags
# that the headers tell of them, with slots.txt: what has been released and never changes.
# Only the compiler's own headers are at hand, so the interfaces can't come to need others.
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
root=$here/../..

slots_of() {
    clang++ --target="$1" -ffreestanding -nostdlibinc -std=c++11 -I"$root" \
        -Xclang -fdump-vtable-layouts -S -o /dev/null "$here/Slots.cpp" >"$dump"
    for class in IFlashHost IFlashDevice2 Logging::ILogger; do
        sed -nE "/^VF?Table indices for '$class'/,/^\$/s/^ *([0-9]+) \| /slot \1: /p" "$dump"
    done
}

# "NUMBER KIND" for each slot: once from slots.txt, once from the tags in a header.
expected_tags() {
    sed -nE "/$1::Reserved/s/slot ([0-9]+):.*/\1 reserved; never called/p
             t; /$1::/s/slot ([0-9]+):.*/\1 $2 implements/p" "$here/slots.txt"
}
tags_in() {
    sed -nE 's,^ *// Slots? ([0-9]+)\. .*,\1,p
             s,^ *// \[([a-z]+ implements); .+\]$,\1,p
             s,^ *// \[(reserved; never called)\]$,\1,p' "$1" | paste -d ' ' - -
}

# "SLOT: NAME" for each slot of both interfaces: once from slots.txt, once from the header in C,
# where overloads have names of their own.
expected_names() {
    sed -nE '/IFlash/s/slot ([0-9]+): .*::([A-Za-z0-9]+)\(.*/\1: \2/p' "$here/slots.txt" |
        sed 's/^2: AddressW.*/2: RangeWithinFlash/; s/^3: WriteDataTo.*/3: WriteHalfwordsToFlash/'
}
names_in() {
    tr '\n' ' ' <"$1" | grep -oE '/\* [0-9]+ \*/ [a-z]+[^;]*;' |
        sed -E 's,^/\* ([0-9]+) \*/.*FLASH_CORVANE_CALL\* ([A-Za-z0-9]+)\).*,\1: \2,'
}

dump=$(mktemp)
trap 'rm -f "$dump"' EXIT
failed=0
for target in {x86_64,i686}-pc-{linux-gnu,windows-msvc}; do
    diff -u --label released --label "$target" "$here/slots.txt" <(slots_of $target) || failed=1
done
for row in "plugin/IFlashHost.h IFlashHost host" "plugin/IFlashDevice2.h IFlashDevice2 device" \
    "logger/ostrel_logger.h ILogger logger"; do
    read -r header class side <<<"$row"
    diff -u --label "slots of $class" --label "tags in its header" \
        <(expected_tags "$class" "$side") <(tags_in "$root/$header") || failed=1
done
diff -u --label released --label "slots in C" \
    <(expected_names) <(names_in "$root/plugin/flash_corvane.h") || failed=1
exit $failed
