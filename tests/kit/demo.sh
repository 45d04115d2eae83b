#!/usr/bin/env bash
# Holds the README to what script/demo prints, with the tool in the directory given.
set -euo pipefail
cd "$(dirname "$0")/../.."
shown=$(sed -n '/^This is what the demo shows/,/^## /p' README.md | sed -n '/^```$/,//{//d;p}')
[ -n "$shown" ] || { echo "README.md shows no demo"; exit 1; }
# The simulated times differ from run to run: the host's own part of them is real.
times() { sed 's/ in .* of simulated time$//'; }
diff <(echo "$shown" | times) <(script/demo "$1" | times) || { echo "README.md shows another demo"; exit 1; }
