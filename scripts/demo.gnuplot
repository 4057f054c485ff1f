# Phase error and frequency of the two runs of scripts/demo. Needs the variable `folder`.
set datafile separator comma
set terminal pngcairo size 1200,700 enhanced font "sans,11" background "#ffffff"
set output folder."/demo.png"
set grid back lt 1 lc rgb "#d0d0d0"
set key at graph 1,1.1 right horizontal samplen 3
set title offset 0,0.8
set xlabel "time, s"

# The rows of one kind, so that lines run from row to row.
pairs(run) = sprintf("< grep '^pair,' %s/%s.csv", folder, run)
frequencies(run) = sprintf("< grep -E ',[gs]etFrequency,' %s/%s.csv", folder, run)

set multiplot layout 2,2 margins 0.09,0.98,0.08,0.92 spacing 0.11,0.22

# Axes fit what comes after the start, from locked() on, and say what they cut off.
cutOff(range) = "set label 1 'cut off: the start, up to ".range."' at graph 0,1.05 left font ',10'"
locked(run) = run eq "simulate" ? 4 : 0.5
fit = "margin = (STATS_max - STATS_min) / 10; set yrange [STATS_min - margin:STATS_max + margin]"

do for [run in "simulate run"] {
    isLive = run eq "run"
    which = isLive ? 5 : 6
    set title isLive ? "Live, 8 pairs a second: phase error" : "Simulated oscillator, a pair a second: phase error"
    set ylabel "phase error, ns"
    set yrange [*:*]
    stats pairs(run) using ($2 > locked(run) ? column(which) : NaN) nooutput
    @fit
    eval cutOff(isLive ? "3 ms" : "1 ms")
    plot pairs(run) using 2:(column(which)) with linespoints pt 7 ps 0.4 lc rgb "#1f6feb" \
        title isLive ? "clock - reference, as measured" : "clock - true time"
}
do for [run in "simulate run"] {
    set title run eq "run" ? "Live: frequency" : "Simulated oscillator: frequency"
    set ylabel "frequency, ppm"
    set yrange [*:*]
    stats frequencies(run) using ($2 > locked(run) ? $8 / 1000.0 : NaN) nooutput
    @fit
    eval cutOff("0 ppm")
    plot frequencies(run) using 2:($8/1000.0) with steps lw 1.5 lc rgb "#d1242f" title "offset ordered"
}
unset multiplot
