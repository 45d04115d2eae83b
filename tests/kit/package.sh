#!/usr/bin/env bash
# package.sh BUILD-DIRECTORY: packs the build twice, which has to give the same bytes, and has
# lintian look at the results.
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
trial=$(mktemp -d)
trap 'rm -rf "$trial"' EXIT
for run in first second; do
    cpack -G DEB --config "$1/CPackConfig.cmake" -B "$trial/$run" \
        -D CPACK_PACKAGING_INSTALL_PREFIX=/usr >"$trial/log" 2>&1 || { cat "$trial/log"; exit 1; }
    sleep 1.1 # so that a time that gets in differs
done
version=$(sed -n 's/^set(CPACK_DEBIAN_PACKAGE_VERSION "\(.*\)")$/\1/p' "$1/CPackConfig.cmake")
cd "$trial/first"
doc=share/doc/corvane-flash
expected=(
    "corvane-flash bin/corvane-flash lib/flash_corvane/lib{flash_corvane,ostrel_logger}.so
        share/man/man1/corvane-flash.1.gz $doc/{copyright,changelog.gz,README.md,docs/boards.md}"
    "libflash-corvane-dev include/flash_corvane/{IFlashHost,IFlashDevice2,flash_corvane}.h
        lib/flash_corvane/libflash_host_check.so lib/cmake/FlashCorvane/FlashCorvaneConfig.cmake
        lib/pkgconfig/flash-corvane.pc $doc/docs/host-guide.md $doc/examples/loader/loader.ld"
)
for row in "${expected[@]}"; do
    read -r package files <<<"$(echo $row)"
    deb=$(echo "${package}_${version}"_*.deb)
    cmp "$deb" "../second/$deb"
    contents=$(dpkg-deb --contents "$deb" | sed 's,/lib/[^/]*-linux-gnu[^/]*/,/lib/,')
    for file in $(eval echo "$files"); do
        grep -q "/$file\$" <<<"$contents" || { echo "no $file in $deb"; exit 1; }
    done
    # What one package's documents name is in it, or in one that it needs.
    dpkg-deb --extract "$deb" "$trial/installed"
    "$here/documents.sh" "$trial/installed/usr/$doc"
done
[ "$(ls ./*.deb | wc -l)" -eq 2 ] || { echo "more packages than expected:"; ls; exit 1; }
zcat "$trial/installed/usr/$doc/changelog.gz" | head -n 1 | grep -qF "($version)" ||
    { echo "the changelog doesn't begin with $version"; exit 1; }
found=$(lintian --fail-on error --allow-root --info --display-info ./*.deb) || { echo "$found"; exit 1; }
# Which overrides match depends on the compiler.
if grep -v mismatched-override <<<"$found" | grep -E 'hardening|spelling'; then exit 1; fi
