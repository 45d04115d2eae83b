#!/usr/bin/env bash
# installed-kit.sh BUILD-DIRECTORY SANITIZERS: installs the build, moves it, and uses it as a
# stranger does: the example built from the installed copy, the tool, its completions and man page.
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
trial=$(mktemp -d)
trap 'rm -rf "$trial"' EXIT
export XDG_CONFIG_HOME=$trial XDG_STATE_HOME=$trial XDG_DATA_HOME=$trial

cmake --install "$1" --prefix "$trial/installed" >/dev/null
kit=$trial/moved
mv "$trial/installed" "$kit"

cmake -G Ninja -S "$kit/share/doc/corvane-flash/examples/minimal-host" -B "$trial/build" \
    -DCMAKE_PREFIX_PATH="$kit" -DCMAKE_CXX_FLAGS="-Wall -Wextra -Werror ${2:+-fsanitize=$2}" >/dev/null
cmake --build "$trial/build" >/dev/null
diff "$here/minimal-host.txt" <("$trial/build/minimal-host")

found=$("$kit/bin/corvane-flash" info | sed -n 's/^Plug-in *//p')
[ "$found" -ef "$kit"/lib*/libflash_corvane.so ] || { echo "the tool loaded '$found'"; exit 1; }

share=$kit/share
bash -n "$share/bash-completion/completions/corvane-flash"
zsh -n "$share/zsh/vendor-completions/_corvane-flash"
fish -n "$share/fish/vendor_completions.d/corvane-flash.fish"
warnings=$(man --warnings -l "$share/man/man1/corvane-flash.1.gz" 2>&1 >"$trial/page")
[ -z "$warnings" ] && grep -q 'EXIT STATUS' "$trial/page" || { echo "man page: $warnings"; exit 1; }
