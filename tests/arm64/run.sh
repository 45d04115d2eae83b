#!/bin/sh
# Runs a program for arm64 as if it were the system's own. A link to this script stands for the program of the
# same name in the directory "bin" beside the link's own.
root=$(dirname "$(readlink -f "$0")")/../../build/arm64-root
exec qemu-aarch64 -L "$root" -0 "$0" "${0%/*}/../bin/${0##*/}" "$@"
