# Draws the table of loads through a GDB server's socket: time over the limit by the delay of a
# request. Called by script/bench with `data` and `picture`.

set terminal svg size 760,400 font "sans-serif,13" background "white"
set output picture
set title "Programming 256 KiB through a GDB server: time over what exchanges and flash need"
set xlabel "delay of a request, ms"
set ylabel "time / limit"
set yrange [0.9:1.3]
set xrange [-0.5:10.5]
set xtics (0, 1, 3, 10)
set grid ytics
set key outside below maxrows 2
chunks = "0.2 5 20"
colour(i) = word("#0072b2 #009e73 #d55e00", i)
ratio(kind, i) = (strcol(1) eq kind && abs($3 - word(chunks, i)) < 0.01) ? $6 : NaN
plot 1.15 with lines dt 3 lc rgb "#888888" title "1.15", \
     for [i = 1:3] data using 2:(ratio("stops", i)) with linespoints dt 2 pt 6 lc rgb colour(i) \
         title sprintf("stopped for looks, %s ms a chunk", word(chunks, i)), \
     for [i = 1:3] data using 2:(ratio("live", i)) with linespoints pt 7 ps 0.7 lc rgb colour(i) \
         title sprintf("live, %s ms a chunk", word(chunks, i))
