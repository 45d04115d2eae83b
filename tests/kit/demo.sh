#!/usr/bin/env bash
# Holds the README to what script/demo prints, with the tool in the directory given.
set -euo pipefail
cd "$(dirname "$0")/../.."
shown=$(sed -n '/^This is what the demo shows/,/^## /p' README.md | sed -n '/^```$/,//{//d;p}')
[ -n "$shown" ] || { echo "README.md shows no demo"; exit 1; }
# The simulated times differ from run to run: the host's own part of them is real. An installed tool has
# its plug-in in a folder of its own.
alike() { sed -E 's/ in .* of simulated time$//; s,(Plug-in +).*(/libflash),\1lib\2,'; }
diff <(echo "$shown" | alike) <(script/demo "$1" | alike) || { echo "README.md shows another demo"; exit 1; }
