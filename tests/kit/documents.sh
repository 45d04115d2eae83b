#!/usr/bin/env bash
# documents.sh DIRECTORY: finds what the installed documents there link to, or name by a path of the
# source tree, and what isn't there.
set -euo pipefail
cd "$1"
failed=0
while IFS=: read -r document path; do
    [ -e "$path" ] || [ -e "$(dirname "$document")/$path" ] || { echo "$document names $path"; failed=1; }
done < <(
    grep -oE '\]\([^):#]+[)#]' -r --include='*.md' . | tr -d ']()#'
    grep -oE '\b(script|build|tests|plugin|device|hostcheck|logger|target/gdb|target/simulated|host|base|bench|cmake|docs|examples)/[A-Za-z][A-Za-z0-9_./-]*' \
        -r --include='*.md' --include='*.[ch]*' --include='*.txt' . | sed 's/[.]$//'
)
[ -n "$(ls)" ] || failed=1
exit $failed
