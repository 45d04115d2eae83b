#!/usr/bin/env bash
# build.sh DIRECTORY: makes firmware.elf there, and from it firmware.ihex and firmware.bin.
set -euo pipefail
source=$(cd "$(dirname "$0")" && pwd)
cd "$1"
command -v arm-none-eabi-as >/dev/null || {
    echo "arm-none-eabi-as is missing; the Debian package is binutils-arm-none-eabi" >&2
    exit 1
}
arm-none-eabi-as "$source/firmware.s" -o firmware.o
arm-none-eabi-ld -T "$source/firmware.ld" firmware.o -o firmware.elf
rm firmware.o
arm-none-eabi-objcopy -O ihex firmware.elf firmware.ihex
arm-none-eabi-objcopy -O binary firmware.elf firmware.bin
