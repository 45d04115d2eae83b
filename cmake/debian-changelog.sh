#!/bin/sh
# debian-changelog.sh CHANGELOG.md MAINTAINER VERSION: the releases in it as Debian writes them. What isn't
# released has no date and is left out. Of two releases on one day the newer one has the later time.
# VERSION is that of the package, and stands for the newest.
exec awk -v maintainer="$2" -v version="$3" '
    function flush(  count, words, i, line) {
        count = split(entry, words)
        line = "  *"
        for (i = 2; i <= count; ++i) {
            if (length(line " " words[i]) > 78) {
                print line
                line = "   "
            }
            line = line " " words[i]
        }
        if (count > 0) print line
        entry = ""
    }
    function finish(  command, stamp) {
        flush()
        if (date == "") return
        command = "date -R -u -d \"" date " 12:00 UTC - " releases++ " minutes\""
        command | getline stamp
        close(command)
        printf "\n -- %s  %s\n\n", maintainer, stamp
    }
    /^## / {
        finish()
        date = match($0, /[0-9]+-[0-9]+-[0-9]+/) ? substr($0, RSTART, RLENGTH) : ""
        if (date == "") next
        printf "corvane-flash (%s) unstable; urgency=medium\n\n", version ? version : $2
        version = ""
        next
    }
    date == "" { next }
    /^- / { flush() }
    /^(- |  )/ { entry = entry " " $0 }
    END { finish() }
' "$1"
