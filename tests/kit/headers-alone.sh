#!/usr/bin/env bash
# Compiles each interface header by itself under every standard from C++11 on, with all warnings,
# and the one in C under C99.
set -euo pipefail
cd "$(dirname "$0")/../.."
failed=0
for header in plugin/IFlashHost.h plugin/IFlashDevice2.h plugin/flash_corvane.h \
    logger/ostrel_logger.h; do
    for standard in 11 14 17 20; do
        for compiler in "g++ -Wall -Wextra -Wconversion -Wshadow -Wold-style-cast" \
            "clang++ -Weverything -Wno-c++98-compat -Wno-c++98-compat-pedantic"; do
            $compiler -Wpedantic -Werror -std=c++$standard -I. -fsyntax-only -x c++ - \
                <<<"#include \"$header\"" || { echo "$header: ${compiler%% *} C++$standard"; failed=1; }
        done
    done
done
# The C header: in C99, for the calling conventions of 32-bit Windows too.
for target in x86_64-pc-linux-gnu {x86_64,i686}-pc-windows-{gnu,msvc}; do
    clang --target=$target -ffreestanding -nostdlibinc -std=c99 -Weverything -Werror -fsyntax-only \
        -x c - -I. <<<'#include "plugin/flash_corvane.h"' || { echo "C99, $target"; failed=1; }
done
exit $failed
