#!/usr/bin/env bash
# documents.sh DIRECTORY: finds what the installed documents there link to, or name by a path of the
# source tree, and what isn't there; also links to headings that there aren't.
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
# Headings, as those who show the documents make anchors of them.
while IFS=: read -r document anchor; do
    sed -n 's/^##* //p' "$document" | tr 'A-Z ' 'a-z-' | tr -cd 'a-z0-9\n-' | grep -qx -- "$anchor" ||
        { echo "$document has no $anchor"; failed=1; }
done < <(grep -oE '\]\(#[^)]+\)' -r --include='*.md' . | tr -d ']()#')
[ -n "$(ls)" ] || failed=1
exit $failed
