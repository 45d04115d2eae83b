#!/bin/sh
# sh build.sh [OUTPUT]: builds the loader. ARM_CC names the compiler, if it isn't to be the first of
# arm-none-eabi-gcc and clang (which needs lld) that is there.
set -eu
if [ -z "${ARM_CC:-}" ]; then
    ARM_CC="clang --target=arm-none-eabi -fuse-ld=lld"
    ! command -v arm-none-eabi-gcc >/dev/null || ARM_CC=arm-none-eabi-gcc
fi
here=$(dirname "$0")
# shellcheck disable=SC2086
exec $ARM_CC -mcpu=cortex-m3 -mthumb -std=c99 -Os -g -Wall -Wextra -ffreestanding -nostdlib \
    -T "$here/loader.ld" "$here/startup.c" "$here/loader.c" "$here/flash.c" \
    -o "${1:-FlashLoaderMerrow.out}"
