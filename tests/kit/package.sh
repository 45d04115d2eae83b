#!/usr/bin/env bash
# package.sh BUILD-DIRECTORY: packs the build twice, which has to give the same bytes, and has
# lintian look at the result.
set -euo pipefail
trial=$(mktemp -d)
trap 'rm -rf "$trial"' EXIT
for run in first second; do
    cpack -G DEB --config "$1/CPackConfig.cmake" -B "$trial/$run" \
        -D CPACK_PACKAGING_INSTALL_PREFIX=/usr >"$trial/log" 2>&1 || { cat "$trial/log"; exit 1; }
    sleep 1.1 # so that a time that gets in differs
done
cmp "$trial"/first/*.deb "$trial"/second/*.deb
contents=$(dpkg-deb --contents "$trial"/first/*.deb)
for file in lib/flash_corvane/lib{flash_corvane,flash_host_check,ostrel_logger}.so \
    share/doc/corvane-flash/{copyright,changelog.gz,CHANGELOG.md,README.md}; do
    grep -q "/$file\$" <<<"$contents" || { echo "no $file"; exit 1; }
done
lintian --fail-on error --allow-root "$trial"/first/*.deb
