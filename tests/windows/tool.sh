#!/bin/sh
# Runs the tool for Windows under Wine as if it were the system's own: WINEPREFIX and CORVANE_TRIED_EXE say
# where Wine and the tool are. The user's settings lie where the variable of other systems has them.
export WINEARCH=win64 WINEDEBUG=-all WINEDLLOVERRIDES="mscoree,mshtml,winemenubuilder.exe=" LC_ALL=C.UTF-8
unset DISPLAY
ulimit -f unlimited 2>/dev/null
# Runs beside each other have the same link.
settings=$XDG_CONFIG_HOME/corvane-flash
for roaming in "$WINEPREFIX"/drive_c/users/*/AppData/Roaming; do
    [ "$(readlink "$roaming/corvane-flash")" = "$settings" ] || ln -sfn "$settings" "$roaming/corvane-flash"
done
[ ! -d "$settings" ] && mkdir -p "$settings" 2>/dev/null
/usr/lib/wine/wine64 "$CORVANE_TRIED_EXE" "$@"
