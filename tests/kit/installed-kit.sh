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

# With sanitizers, as the libraries were built: by Clang. They know no object that was made in C.
examples=(minimal-host c-host)
[ -z "${2:-}" ] || { export CXX=clang++; examples=(minimal-host); }
flags="-Wall -Wextra -Wpedantic -Werror ${2:+-fsanitize=$2}"
for example in "${examples[@]}"; do
    cmake --no-warn-unused-cli -G Ninja -S "$kit/share/doc/corvane-flash/examples/$example" -B "$trial/$example" \
        -DCMAKE_PREFIX_PATH="$kit" -DCMAKE_{C,CXX}_FLAGS="$flags" >/dev/null
    cmake --build "$trial/$example" >/dev/null
done
for example in "${examples[@]}"; do
    diff "$here/$example.txt" <("$trial/$example/$example")
done

# Every operation works on their pretend devices: a mass erase erases what was loaded, and what was
# not committed is lost in a reset.
plugin=$(echo "$kit"/lib*/flash_corvane/libflash_corvane.so)
words=(BlankCheck Load "FlashEraseType=Entire Flash" Erase BlankCheck CalculateChecksum
    FlashUserRegister0Input=12ab FlashUserRegister0Commit=1 ProgramUserRegister0
    FlashUserRegister1Input=34cd ProgramUserRegister1 ReadUserRegister1
    Erase ReadUserRegister0 ReadUserRegister1
    FlashMACAddrInput=02-1b-c3-04-05-06 FlashMACAddrCommit=1 ProgramMACAddress Erase ReadMACAddress)
for example in "${examples[@]}"; do
    diff "$here/operations.txt" \
        <("$trial/$example/$example" "$plugin" "${words[@]}" | sed '0,/^operations\|^Dorna/d')
done
# The same by pkg-config, which finds the kit wherever it lies. A program for the debugger plays the
# plug-in to the example of a loader.
pkgconfig() { PKG_CONFIG_PATH=$(echo "$kit"/lib*/pkgconfig) pkg-config "$@" flash-corvane; }
[ "$(pkgconfig --variable=plugin)" -ef "$plugin" ] || { echo "pkg-config tells another plug-in"; exit 1; }
loader=$kit/share/doc/corvane-flash/examples/loader
if [ -z "${2:-}" ]; then
    # shellcheck disable=SC2046
    ${CC:-cc} -std=c99 $(pkgconfig --cflags) "-DFLASH_CORVANE_LIBRARY=\"$plugin\"" \
        "$kit/share/doc/corvane-flash/examples/c-host/main.c" -o "$trial/by-pkg-config"
    diff "$here/c-host.txt" <("$trial/by-pkg-config")
    ARM_CC="clang --target=arm-none-eabi -fuse-ld=lld -Wpedantic -Werror" sh "$loader/build.sh" "$trial/loader.out"
    timeout 60 gdb-multiarch -nx -batch -x "$loader/try.gdb" "$trial/loader.out" >"$trial/played" 2>&1 ||
        { cat "$trial/played"; exit 1; }
    grep -q '^status 0x0, flash at 0x1000 holds 0x12345678$' "$trial/played" || { cat "$trial/played"; exit 1; }
fi

found=$("$kit/bin/corvane-flash" info | sed -n 's/^Plug-in *//p')
[ "$found" -ef "$kit"/lib*/flash_corvane/libflash_corvane.so ] || { echo "the tool loaded '$found'"; exit 1; }

# The hosts of the kit keep the contract. The check programs nothing, which the examples find out.
check=$(echo "$kit"/lib*/flash_corvane/libflash_host_check.so)
head -c 100 /dev/zero >"$trial/image.bin"
passes() { "$@" >>"$trial/told" 2>&1 || { cat "$trial/told"; exit 1; }; }
tool=("$kit/bin/corvane-flash" --plugin "$check")
passes "${tool[@]}" operation CheckProgress
passes "${tool[@]}" operation CheckLoader
passes "${tool[@]}" program "$trial/image.bin" --base 0 --erase none --no-verify
for example in "${examples[@]}"; do
    passes "$trial/$example/$example" "$check" CheckProgress CheckLoader
    "$trial/$example/$example" "$check" >>"$trial/told" 2>&1 && exit 1
done
grep 'expected' "$trial/told" && exit 1
for all in 'WriteDataToFlash: 1[45] of 1[45] hold' 'CheckLoader: 18 of 18 hold'; do
    [ "$(grep -c "Host check, $all" "$trial/told")" = $((1 + ${#examples[@]})) ] ||
        { grep -A1 'Host check' "$trial/told"; exit 1; }
done

share=$kit/share
"$here/documents.sh" "$share/doc/corvane-flash"
bash -n "$share/bash-completion/completions/corvane-flash"
zsh -n "$share/zsh/vendor-completions/_corvane-flash"
fish -n "$share/fish/vendor_completions.d/corvane-flash.fish"
warnings=$(man --warnings -l "$share/man/man1/corvane-flash.1.gz" 2>&1 >"$trial/page")
[ -z "$warnings" ] && grep -q 'EXIT STATUS' "$trial/page" || { echo "man page: $warnings"; exit 1; }
