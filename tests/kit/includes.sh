#!/usr/bin/env bash
# Holds each folder to the folders that it may include, and finds circles between files.
set -euo pipefail
cd "$(dirname "$0")/../.."

# FOLDER: the folders whose headers its files may include, besides its own.
allowed="
base:
plugin: logger device
device: plugin
hostcheck: device plugin
flash: device plugin
verify: device plugin
operations: device plugin
logger:
target:
target/gdb/wire: base
target/gdb/client: target/gdb/wire target base
target/gdb/server: target/gdb/wire target base
target/gdb/probe: target/gdb/client target/gdb/server target/gdb/wire target base
target/simulated/options: base
target/simulated: target/simulated/options target/gdb/server target base
host/base: base
host/files: host/base base
host/facts:
host/image: host/image/records host/files host/base base
host/image/records: host/image host/files host/base base
host/settings: host/facts host/files host/base base
host/output: host/files host/base base
host/targets: host/facts host/files host/base target target/gdb/wire target/gdb/client target/gdb/server target/gdb/probe target/simulated target/simulated/options base
host/driver: host/output host/settings host/targets host/image host/facts host/files host/base plugin target base
host/checks: host/driver host/targets host/output host/settings host/facts host/base target base
host/flashing: host/driver host/targets host/image host/output host/settings host/facts host/files host/base target/gdb/probe base
host/cli: host/settings host/targets host/facts host/files host/base target/gdb/client target/simulated/options
host/commands: host/cli host/checks host/flashing host/driver host/targets host/image host/output host/settings host/facts host/files host/base base
host: host/commands host/cli host/output host/settings host/facts host/files host/base"

failed=0
includes=$(mktemp)
trap 'rm -f "$includes"' EXIT
while IFS=': ' read -r folder others; do
    [ -n "$folder" ] || continue
    for file in "$folder"/*.{h,cpp}; do
        [ -f "$file" ] || continue
        sed -n 's/^#include "\(.*\)"$/\1/p' "$file" | while read -r header; do
            echo "$file $header"
        done
    done >"$includes.folder"
    cat "$includes.folder" >>"$includes"
    while read -r file header; do
        [[ " $folder $others " == *" ${header%/*} "* ]] ||
            { echo "$file may not include $header"; failed=1; }
    done <"$includes.folder"
    rm "$includes.folder"
done <<<"$allowed"

[ -s "$includes" ] || { echo "no includes found"; failed=1; }
tsort "$includes" >/dev/null || failed=1
exit $failed
