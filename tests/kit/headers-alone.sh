#!/usr/bin/env bash
# Compiles each interface header by itself under every standard from C++11 on, with all warnings.
set -euo pipefail
cd "$(dirname "$0")/../.."
failed=0
for header in plugin/IFlashHost.h plugin/IFlashDevice2.h logger/ostrel_logger.h; do
    for standard in 11 14 17 20; do
        for compiler in "g++ -Wall -Wextra -Wconversion -Wshadow -Wold-style-cast" \
            "clang++ -Weverything -Wno-c++98-compat -Wno-c++98-compat-pedantic"; do
            $compiler -Wpedantic -Werror -std=c++$standard -I. -fsyntax-only -x c++ - \
                <<<"#include \"$header\"" || { echo "$header: ${compiler%% *} C++$standard"; failed=1; }
        done
    done
done
exit $failed
