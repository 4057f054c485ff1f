# Phase error and frequency of the two runs of scripts/demo. Needs the variable `folder`.
set datafile separator comma
set terminal pngcairo size 1200,700 enhanced font "sans,11" background "#ffffff"
set output folder."/demo.png"
set grid lc rgb "#dddddd"
set key top right

# The rows of one kind, so that lines run from row to row.
pairs(run) = sprintf("< grep '^pair,' %s/%s.csv", folder, run)
frequencies(run) = sprintf("< grep -E ',[gs]etFrequency,' %s/%s.csv", folder, run)

set multiplot layout 2,2 margins 0.08,0.98,0.08,0.94 spacing 0.09,0.14

# A millisecond and a few nanoseconds on one axis: linear around zero, logarithmic outside.
set nonlinear y via asinh(y/10.) inverse 10.*sinh(y)
set yrange [-3000:1e7]
set ytics ("-1 µs" -1e3, "-100 ns" -100, "-10 ns" -10, "0" 0, "10 ns" 10, "100 ns" 100, \
           "1 µs" 1e3, "10 µs" 1e4, "100 µs" 1e5, "1 ms" 1e6, "10 ms" 1e7)
set title "Simulated oscillator, a pair a second: phase error"
plot pairs("simulate") using 2:6 with linespoints pt 7 ps 0.4 lc rgb "#1f6feb" title "clock - true time"
set title "Live, 8 pairs a second: phase error"
plot pairs("run") using 2:5 with linespoints pt 7 ps 0.4 lc rgb "#1f6feb" title "clock - reference, as measured"

unset nonlinear y
set yrange [-14:2]
set ytics auto
set ylabel "ppm" offset 1
set xlabel "s"
set title "Simulated oscillator: frequency"
plot frequencies("simulate") using 2:($8/1000.0) with steps lw 1.5 lc rgb "#d1242f" title "offset ordered"
set title "Live: frequency"
plot frequencies("run") using 2:($8/1000.0) with steps lw 1.5 lc rgb "#d1242f" title "offset ordered"
unset multiplot
