# One run of each row of scripts/peers in the same scenario. Needs the variables `folder` and `scenario`,
# and `rows` with | between them.
set terminal pngcairo size 800,560 enhanced font "sans,9" background "#ffffff"
set output "docs/peers.png"
set grid back lt 1 lc rgb "#d0d0d0"
unset key
set xrange [1000:2000]
set xtics 250
set ytics 250
count = words(rows = system("printf %s '".rows."' | tr ' |' '~ '"))   # words with ~ for blanks
set multiplot layout (count + 1) / 2, 2 margins 0.07,0.97,0.06,0.91 spacing 0.06,0.075 \
    title "True error in ns over time in s, scenario ".scenario.", seed 1" font ",13"
do for [i = 1:count] {
    row = system("printf %s '".word(rows, i)."' | tr '~' ' '")
    file = folder."/".row
    set yrange [*:*]
    stats file using ($1 >= 1000 ? $2 : NaN) nooutput
    set yrange [-500:500]
    set title sprintf("%s: RMS %.1f", row, sqrt(STATS_sumsq / STATS_records)) offset 0,-0.7
    plot file using 1:2 with lines lw 1 lc rgb row[1:6] eq "dravik" ? "#1f6feb" : "#6e7781"
}
unset multiplot
