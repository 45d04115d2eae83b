# Draws the table of whole loads: time over the limit by chunk time, with and without a host that
# waits for the loader. Called by script/bench with `data` and `picture`.

set terminal svg size 760,460 font "sans-serif,13" background "white"
set output picture
set title "Programming 1 MiB: time over what link and flash need"
set xlabel "flash time of a 2 KiB chunk, ms (latency 30 us)"
set ylabel "time / limit"
set logscale y
set yrange [0.9:60]
set ytics (1, 2, 3, 5, 10, 20, 50)
set xrange [4:21]
set xtics (5, 10, 20)
set grid ytics
set key inside top right
speeds = "64 200 1000"
colour(i) = word("#0072b2 #009e73 #d55e00", i)
ratio(column_, i) = ($1 == 30 && $2 == word(speeds, i) + 0) ? column(column_) : NaN
plot for [i = 1:3] data using 3:(ratio(8, i)) with linespoints dt 2 pt 6 ps 1.2 lc rgb colour(i) \
         title sprintf("left to the plug-in's polls, %s KB/s", word(speeds, i)), \
     for [i = 1:3] data using 3:(ratio(6, i)) with linespoints pt 7 ps 0.7 lc rgb colour(i) \
         title sprintf("host waits, %s KB/s", word(speeds, i))
