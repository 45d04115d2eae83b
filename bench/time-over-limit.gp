# Draws the table of whole loads: time over the limit by chunk time, with and without a host that
# waits for the loader. Called by script/bench with `data` and `picture`.

set terminal svg size 760,420 font "sans-serif,13" background "white"
set output picture
set title "Programming 1 MiB: time over what link and flash need (latency 30 us)"
set xlabel "flash time of a 2 KiB chunk, ms"
set ylabel "time / limit"
set logscale y
set yrange [0.9:40]
set ytics (1, 1.5, 2, 3, 5, 10, 20, 40)
set xrange [4:21]
set xtics (5, 10, 20)
set grid ytics
set key outside right
speeds = "64 200 1000"
line(column_, speed) = ($1 == 30 && $2 == speed) ? column(column_) : NaN
plot for [s in speeds] data using 3:(line(8, s + 0)) with linespoints pt 6 dt 2 \
       title sprintf("plug-in's polls, %s KB/s", s), \
     for [s in speeds] data using 3:(line(6, s + 0)) with linespoints pt 7 \
       title sprintf("host waits, %s KB/s", s)
