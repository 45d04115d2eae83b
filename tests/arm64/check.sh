#!/usr/bin/env bash
# check.sh NAME...: tries what script/package arm64 has built, under user-mode QEMU: the programs NAME_tests, and
# the packages, unpacked, with the demo. What needs a debugger or a probe server isn't tried.
set -euo pipefail
cd "$(dirname "$0")/../.."
build=$PWD/build/arm64
out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
rm -rf "$build/run"
mkdir "$build/run"
for program in "$build"/bin/*; do
    ln -s "$PWD/tests/arm64/run.sh" "$build/run/${program##*/}"
done

# Libraries serve kernels with pages of 64 KiB, too.
pages_fit() {
    local file
    for file in "$build"/bin/corvane-flash "$build"/lib/*.so; do
        readelf -lW "$file" | awk '$1 == "LOAD" && $NF != "0x10000" { exit 1 }' || { echo "$file"; return 1; }
    done
}

# The packages as dpkg lays them out. The link takes the place of the tool in PATH.
packages_work() {
    tests/kit/package.sh "$build" || return 1
    (cd "$build" && cpack -G DEB -B "$out/packages") >/dev/null || return 1
    local package
    for package in "$out"/packages/*.deb; do
        [ "$(dpkg-deb --field "$package" Architecture)" = arm64 ] || { echo "$package"; return 1; }
        dpkg-deb --extract "$package" "$out/installed" || return 1
    done
    mkdir "$out/installed/usr/run"
    ln -s "$PWD/tests/arm64/run.sh" "$out/installed/usr/run/corvane-flash"
    tests/kit/demo.sh "$out/installed/usr/run"
}

# Command lines are given to the tool itself. The other tests have it in them, which is faster.
program_passes() {
    local -x CORVANE_TRIED_TOOL
    [ "$1" != command_line_tests ] || CORVANE_TRIED_TOOL=$build/run/corvane-flash
    timeout 900 "$build/run/$1" --gtest_brief=1
}

# check NAME COMMAND...: runs the command, which says what is wrong.
check() {
    local start=$SECONDS
    if "${@:2}" >"$out/$1.log" 2>&1 </dev/null; then
        echo "ok       $1 ($((SECONDS - start)) s)"
    else
        echo "FAILED   $1"
        cat "$out/$1.log"
    fi
}

running=0  # many wait more than they compute
{
    for name in "$@"; do
        [ $((running += 1)) -le "$((2 * $(nproc)))" ] || wait -n
        check "$name" program_passes "${name}_tests" &
    done
    wait
    check pages pages_fit
    check packages packages_work
} | tee "$out/results"
passed=$(grep -c '^ok ' "$out/results") failed=$(grep -c '^FAILED ' "$out/results" || true)
echo
echo "$passed passed, $failed failed"
[ "$failed" -eq 0 ] && [ "$passed" -eq $(($# + 2)) ]
