# Draws the table of loads through a GDB server's socket: time over the limit by the delay of a
# request. Called by script/bench with `data` and `picture`.

set terminal svg size 760,400 font "sans-serif,13" background "white"
set output picture
set title "Programming 256 KiB through a GDB server"
set xlabel "delay of a request, ms"
set ylabel "time / limit"
set yrange [0.8:1.2]
set xrange [-0.5:10.5]
set xtics (0, 1, 3, 10)
set grid ytics
set key inside top right maxrows 3 samplen 2 font ",11"
chunks = "0.2 5 20"
colour(i) = word("#0072b2 #009e73 #d55e00", i)
rows(kind, i) = sprintf("< awk '$1 == \"%s\" && $3 + 0 == %s' %s", kind, word(chunks, i), data)
plot for [i = 1:3] rows("stops", i) using 2:6 with linespoints dt 2 pt 6 lc rgb colour(i) \
         title sprintf("stopped for looks, %s ms a chunk", word(chunks, i)), \
     for [i = 1:3] rows("live", i) using 2:6 with linespoints pt 7 ps 0.7 lc rgb colour(i) \
         title sprintf("not stopped, %s ms a chunk", word(chunks, i))
