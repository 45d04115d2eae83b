#!/usr/bin/env bash
# Holds each folder to the folders that it may include, and finds circles between files.
set -euo pipefail
cd "$(dirname "$0")/../.."

# FOLDER: the folders whose headers its files may include, besides its own.
allowed="
plugin: logger device
device: plugin
hostcheck: device plugin
flash: device plugin
verify: device plugin
operations: device plugin
logger:
target:
target/gdb: target
target/simulated: target target/gdb
host/base:
host/image: host/image/records host/base
host/image/records: host/image host/base
host/settings: host/base
host/output: host/base
host/targets: host/base target target/gdb target/simulated
host/driver: host/output host/settings host/targets host/image host/base plugin target
host/flashing: host/driver host/image host/output host/settings host/base
host/cli: host/settings host/targets host/base target/gdb target/simulated
host/commands: host/cli host/flashing host/driver host/targets host/image host/output host/settings host/base
host: host/commands host/cli host/output host/settings host/base"

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
