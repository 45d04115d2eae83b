#!/usr/bin/env bash
# guide.sh TOOL [--write]: compares what the documents for makers of hosts take from the tool, the
# table of settings and the transcript, with what the tool says now, and its man page; or writes them.
set -euo pipefail
tool=$(realpath "$1")
root=$(cd "$(dirname "$0")/../.." && pwd)
docs=$root/docs
trial=$(mktemp -d)
trap 'rm -rf "$trial"' EXIT
cd "$trial"
export XDG_CONFIG_HOME=$trial XDG_STATE_HOME=$trial XDG_DATA_HOME=$trial LC_ALL=C

settings() {
    echo '| key | takes | recommended | meaning |'
    echo '|---|---|---|---|'
    "$tool" --json settings 2>/dev/null | grep '"event":"end"' | grep -oE '\{"key":[^}]*\}' |
        sed -E 's/^\{"key":"(.*)","value":"(.*)","origin":.*,"meaning":"(.*)","accepts":"(.*)"\}$/| \1 | \4 | \2 | \3 |/
                s/\\"/"/g; s/\| nothing: only the plug-in writes it \|/| written by the plug-in |/'
}

# A trace without its times, and without what differs from one machine to the next: pointers, the
# tool's directory, and how often a command is polled before it is done.
traced() {
    "$tool" --sim quen,flash=64K --sim-file board --trace trace "$@" >log 2>&1 || { cat log; exit 1; }
    sed -E "s/^ *[0-9.]+  //; s/\\(0x[0-9a-f]{9,}/(DATA/; s|$(dirname "$tool")/|/opt/host/|g" trace |
        sed -E '/^#/d; /^confirm /d; /host .*ReadMemory 0x400fd008.*= 0x00000008$/d
                /host .*ReadMemory 0x400fd008.*= 0x0000000[24]$/,/Sleep/d'
}

# From the call that does the work to the end of it; what the tool does besides is its own.
work() { sed -n "/^call     $1/,/^plug-in  3 FlashCorvane::$1() =/p"; }

transcript() {
    printf 'Hello, flash' >hello.bin
    traced program hello.bin --base 1004 --no-verify >load
    echo '## Creating, and a load of 12 bytes to 0x1004'
    printf '\n```\n'
    sed -n '1,/ListSupportedOperations/p; /^call     ResetSettings 0/,/FlashCorvane::ResetSettings()$/p' load
    work WriteDataToFlash <load
    printf '```\n\n## "Erase" of that sector\n\n```\n'
    traced --set FlashEraseStartAddr=1004 --set FlashEraseEndAddr=1004 operation Erase |
        work PerformOperation
    printf '```\n\n## "ProgramMACAddress", with a commit\n\n```\n'
    traced --set FlashMACAddrInput=02-1b-c3-04-05-06 --set FlashMACAddrCommit=1 \
        operation ProgramMACAddress | work PerformOperation
    echo '```'
}

failed=0
for row in "settings host-guide.md" "transcript host-transcript.md"; do
    read -r part file <<<"$row"
    "$part" >part
    sed "/^<!-- begin $part -->/,/^<!-- end $part -->/{//!d}; /^<!-- begin $part -->/r part" \
        "$docs/$file" >new
    if [ "${2:-}" = --write ]; then
        cp new "$docs/$file"
    elif ! diff -u "$docs/$file" new; then
        echo "docs/$file isn't what the tool says; run tests/kit/guide.sh build/bin/corvane-flash --write"
        failed=1
    fi
done

manual=$root/host/cli/corvane-flash.1
"$tool" --man >manual
if [ "${2:-}" = --write ]; then
    cp manual "$manual"
elif ! diff -u "$manual" manual; then
    echo "the man page isn't what the tool says; run tests/kit/guide.sh build/bin/corvane-flash --write"
    failed=1
fi
exit $failed
