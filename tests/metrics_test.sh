#!/usr/bin/env bash
# Figures of traces as the program prints them, and limits that fail a build.
# Usage: metrics_test.sh FOLDER CC, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
host=(${EMULATOR:+"$EMULATOR"} "$(cd "$1" && pwd)/dravik-host")
source "$(dirname "$0")/support/expect.sh"
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
cd "$scratch" || exit 1

metrics() { "${host[@]}" metrics "$@"; }

# A trace of known figures: errors of 30, -40 and 0 ns in turn, after 5 us until the lock, with a
# reading missing after 40 s.
awk 'BEGIN { print "kind,elapsed_s,reference_ns,clock_ns,call,value"
    for (i = 0; i < 100; ++i) {
        if (i == 40) continue
        e = i < 10 ? 5000 : i % 3 == 0 ? 30 : i % 3 == 1 ? -40 : 0
        printf "pair,%d,%d000000000,%d%09d,,\n", i, 1700000000 + i, 1700000000 + i + (e < 0 ? -1 : 0), e < 0 ? 1000000000 + e : e
        if (i == 1 || i >= 10) print "call," i ",,,setFrequency,-1000"
        if (i == 9) print "call,9,,,stepTime,-5000"
    } }' > trace.csv
printf '1e-9\n-1e-9\n1e-9\n' > numbers
printf '%s\n' -0 1e-25 -0 -0 > zeros
sed 's/1e-25/-0/' zeros > negative
printf '1e200\n0\n' > large
yes 0 | head -n 1000 > long
head -n 999 long > few
printf 'ptp4l[%d.0]: rms   50 max   80 freq  +1000 +/-  20\n' 1 2 > summaries
head -n 4 trace.csv > unlocked
printf 'phc2sys[%d.0]: CLOCK_REALTIME rms %d max 60 freq +1 +/- 1 delay 5 +/- 0\n' 1 10 2 20 3 30 > sums
printf 'time,offset\n0,1\n1,-3\n2,2\n' > columns
printf '%se-9\n' 0 1 8 27 64 125 216 343 512 > cubes
expect "table, and JSON" "" "$({ metrics cubes --interval 500ms && metrics cubes --interval 500ms --json; } | diff - <(cat << 'END'
cubes: measured error, 9 points from 0.000 s to 4.000 s
mean +144 ns, RMS 222.9 ns, peak 512 ns, peak to peak 512 ns
       tau        n       ADEV      OADEV       MDEV       TDEV       MTIE
    500 ms        1  3.795e-08  3.795e-08  3.795e-08   10.95 ns     169 ns
       1 s        2  7.332e-08  7.200e-08  7.048e-08   40.69 ns     296 ns
       2 s        4  1.358e-07  1.358e-07          -          -     448 ns
{"points": 9, "from": 0, "to": 4, "mean": 1.44e-07, "rms": 2.2285122092253987e-07, "peak": 5.12e-07, "peakToPeak": 5.12e-07, "timeToLock": null, "locksLost": null, "interval": 0.5, "stretch": 9, "stability": [
  {"n": 1, "tau": 0.5, "adev": 3.794733192202055e-08, "oadev": 3.794733192202055e-08, "mdev": 3.794733192202055e-08, "tdev": 1.0954451150103322e-08, "mtie": 1.69e-07},
  {"n": 2, "tau": 1, "adev": 7.332121111929344e-08, "oadev": 7.200000000000001e-08, "mdev": 7.04840407468244e-08, "tdev": 4.069397989875162e-08, "mtie": 2.96e-07},
  {"n": 4, "tau": 2, "adev": 1.3576450198781714e-07, "oadev": 1.3576450198781714e-07, "mdev": null, "tdev": null, "mtie": 4.4800000000000004e-07}], "format": "a column of phase", "source": "", "unread": 0, "events": 0}
END
))"
check() { # NAME STATUS PATTERN OPTIONS...
    local name=$1 status=$2 pattern=$3 found=0
    shift 3
    metrics "$@" > out 2> err || found=$?
    expect "$name: exit status" "$status" "$found"
    expect "$name: lines on stderr" $((status > 0)) "$(wc -l < err)"
    cat out err > both
    expect "$name: $pattern" 0 "$(grep -qE -- "$pattern" both; echo $?)"
}
while IFS='|' read -r name status pattern options; do
    # shellcheck disable=SC2086  # split on purpose
    check "$name" "$status" "$pattern" $options
done << 'END'
from the lock on  |0|^trace.csv: measured error, 89 points from 10\.000 s to 99\.000 s$|trace.csv
its figures       |0|^mean -2\.921 ns, RMS 28\.[0-9]+ ns, peak 40 ns, peak to peak 70 ns$|trace.csv
its lock          |0|^locked after 10 s, lock lost 0 times$|trace.csv
before the lock   |0|^never locked$|unlocked
a part of it      |0|2 points from 20\.000 s to 21\.000 s$|trace.csv --from 20s --to 21s
a gap             |0|^longest stretch without a gap: 59 points$|trace.csv
no gap            |0|^ +8 s +8 |trace.csv --from 41s
as JSON           |0|^\{"points": 89, "from": 10, "to": 99, .*"locksLost": 0, "interval": 1, |trace.csv --json
a limit broken    |3|^dravik-host: peak<40ns does not hold: it is 40 ns$|trace.csv --assert peak<40ns --assert peak<=40ns
two broken        |3|^dravik-host: rms<1ns .*; locks-lost>0 does not hold: it is 0$|trace.csv --assert rms<1ns --assert locks-lost>0
without its slope |0|^mean .* peak to peak 136.9 ns$|trace.csv --remove-slope
of summaries      |0|^mean not known, RMS 21.6 ns, peak 60 ns, peak to peak not known$|sums
no mask of them   |1|^dravik-host: summaries cannot be held to a mask$|sums --mask g8273.2-a
in a unit         |0|^mean .0 ns, RMS 2.16 us, peak 3 us, peak to peak 5 us$|columns --unit us
a frequency       |0|^numbers: measured error, 4 points|numbers --interval 1s --frequency
no slope          |1|^dravik-host: one measurement has no slope$|trace.csv --from 20s --to 20s --remove-slope
nothing selected  |1|^dravik-host: trace.csv has no measurement in that time$|trace.csv --from 1h
no numbers        |1|^dravik-host: trace.csv has times of its own; leave --interval out$|trace.csv --interval 1s
no figure         |2|'rmse' is none of rms, peak, |trace.csv --assert rmse<1ns
frequency of what |2|--frequency requires --interval|trace.csv --frequency
tiny and negative |0|^mean \+0 ns, RMS 0 ns, peak 0 ns, peak to peak 0 ns$|zeros --interval 1s
no negative zero  |0|"peak": 0, |negative --interval 1s --json
out of range      |1|^dravik-host: large cannot be read: line 1 is an error of years$|large --interval 1s
no such mask      |2|--mask|trace.csv --mask g8273.2-e
mask and edition  |3|^mask g8273.2-c: ITU-T G.8273.2, second edition of October 2020 with amendments 1 .* and 2 .*class C$|trace.csv --mask g8273.2-c
mask of summaries |1|^dravik-host: summaries cannot be held to a mask$|summaries --mask 802.1as
mask broken       |3|^mask g8273.2-c +max .TE. 30 ns +broken +40 ns$|trace.csv --mask g8273.2-c
not judged        |3|^mask g8273.2-a +cTE 50 ns, mean over 1000 s +not judged +2.712 ns; needs 1000 s of data, has 59 s$|trace.csv --mask g8273.2-a
not judged, status|3|^dravik-host: limits of masks not judged: 1$|few --interval 1s --mask g8273.2-d
what of them      |3|^dravik-host: limits of masks broken: 6, not judged: 1$|trace.csv --mask g8273.2-c --mask 802.1as
END

echo "$checks checks, $failures failures"
exit $((failures > 0))
