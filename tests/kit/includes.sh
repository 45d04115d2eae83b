#!/usr/bin/env bash
# Holds each folder to the folders that it may include, and finds circles between files, and headers or
# conditions of a system outside of the folder that is for them.
set -euo pipefail
cd "$(dirname "$0")/../.."

# FOLDER: the folders whose headers its files may include, besides its own.
allowed="
base:
base/system:
base/system/posix: base/system
base/system/windows: base/system
plugin: logger device
device: plugin
hostcheck: device plugin base/system
flash: device plugin
verify: device plugin
operations: device plugin
logger:
target:
target/gdb/wire: base base/system
target/gdb/client: target/gdb/wire target base base/system
target/gdb/server: target/gdb/wire target base
target/gdb/probe: target/gdb/client target/gdb/server target/gdb/wire target base
target/simulated/options: base
target/simulated: target/simulated/options target/gdb/server target base
host/base: base base/system
host/files: host/base base base/system
host/facts:
host/image: host/image/records host/files host/base base base/system
host/image/records: host/image host/files host/base base
host/settings: host/facts host/files host/base base base/system
host/output: host/files host/base base base/system
host/targets: host/facts host/files host/base target target/gdb/wire target/gdb/client target/gdb/server target/gdb/probe target/simulated target/simulated/options base base/system
host/driver: host/output host/settings host/targets host/image host/facts host/files host/base plugin target base base/system
host/checks: host/driver host/targets host/output host/settings host/facts host/base target base base/system
host/flashing: host/driver host/targets host/image host/output host/settings host/facts host/files host/base target target/gdb/probe base base/system
host/cli: host/settings host/targets host/facts host/files host/base target/gdb/client target/simulated/options base/system
host/commands: host/cli host/checks host/flashing host/driver host/targets host/image host/output host/settings host/facts host/files host/base base base/system
host: host/commands host/cli host/output host/settings host/facts host/files host/base base/system"

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

system='<(unistd|fcntl|poll|signal|csignal|dlfcn|link|netdb|termios|pwd|io|windows|winsock2|(sys|arpa|netinet)/[a-z_]+)[.h]*>'
condition='(_WIN32|__linux__|__unix__|__MINGW32__)'
if grep -rnE "^#include $system|^#.*\b$condition\b" --include='*.h' --include='*.cpp' \
    base host target hostcheck device flash verify operations | grep -vE '^base/system/(posix|windows)/'; then
    echo "these belong in base/system/"
    failed=1
fi
# A plain text is none of UTF-8 to the C++ library: base/system/Paths.h turns it into a path and back.
if grep -rnE '\bstd::filesystem::path\(|\bfs::path\([^"]|[a-z)]\.(generic_)?string\(\)' --include='*.h' --include='*.cpp' \
    base host target | grep -vE '^base/system/posix/|fs::path\(\)'; then
    echo "these need base::PathOf or base::NameOf"
    failed=1
fi
exit $failed
