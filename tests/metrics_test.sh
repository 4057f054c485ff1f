#!/usr/bin/env bash
# Figures of traces: against published ones, of traces with gaps, and limits that fail a build.
# Usage: metrics_test.sh FOLDER CC, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
host=(${EMULATOR:+"$EMULATOR"} "$(cd "$1" && pwd)/dravik-host")
source "$(dirname "$0")/support/expect.sh"
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
cd "$scratch" || exit 1

metrics() { "${host[@]}" metrics "$@"; }

# A published sequence of a thousand frequencies, and what its deviations are known to be, here to
# 7 digits within the last of them; MTIE of its phase without the slope. Rows of FIGURE VALUE ERROR.
awk 'BEGIN { n = 1234567890; for (i = 0; i < 1000; ++i) { printf "%.17g\n", n / 2147483647; n = 16807 * n % 2147483647 } }' > numbers
while read -r figure value error; do
    unit=$([[ $figure == [tm]?[ie][ev]* && $figure != mdev* ]] && echo s)
    slope=$([[ $figure == mtie* ]] && echo --remove-slope)
    # shellcheck disable=SC2086  # an option or none
    metrics numbers --interval 1s --frequency $slope > out 2>&1 \
        --assert "$figure>$(awk "BEGIN { printf \"%.9g\", $value - $error }")$unit" \
        --assert "$figure<$(awk "BEGIN { printf \"%.9g\", $value + $error }")$unit"
    status=$?
    expect "$figure is $value: $(tail -n 1 out)" 0 $status
done << 'END'
adev(1s) 2.922319e-01 1e-7
oadev(1s) 2.922319e-01 1e-7
mdev(1s) 2.922319e-01 1e-7
tdev(1s) 1.687202e-01 1e-7
adev(10s) 9.965736e-02 1e-8
oadev(10s) 9.159953e-02 1e-8
mdev(10s) 6.172376e-02 1e-8
tdev(10s) 3.563623e-01 1e-7
adev(100s) 3.897804e-02 1e-8
oadev(100s) 3.241343e-02 1e-8
mdev(100s) 2.170921e-02 1e-8
tdev(100s) 1.253382e+00 1e-6
mtie(1s) 0.50597 1e-5
mtie(3s) 1.2984 1e-4
mtie(7s) 2.2922 1e-4
mtie(15s) 2.9949 1e-4
mtie(31s) 4.4550 1e-4
mtie(63s) 6.5989 1e-4
mtie(127s) 6.8061 1e-4
mtie(255s) 7.8205 1e-4
END

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
all of it         |0|peak 5 us|trace.csv --from 0s
a part of it      |0|2 points from 20\.000 s to 21\.000 s$|trace.csv --from 20s --to 21s
a gap             |0|^longest stretch without a gap: 59 points$|trace.csv
no gap            |0|^ +8 s +8 |trace.csv --from 41s
as JSON           |0|^\{"points": 89, "from": 10, "to": 99, .*"locksLost": 0, "interval": 1, |trace.csv --json
limits held       |0|peak|trace.csv --assert rms<29ns --assert rms>28ns --assert peak<=40ns --assert locks-lost<1 --assert time-to-lock<11s --assert mtie(1s)<=70ns
a limit broken    |3|^dravik-host: peak<40ns does not hold: it is 40 ns$|trace.csv --assert peak<40ns
two broken        |3|^dravik-host: rms<1ns .*; locks-lost>0 does not hold: it is 0$|trace.csv --assert rms<1ns --assert locks-lost>0
not to be told    |3|adev\(1000s\)<1 cannot be computed from these data|trace.csv --assert adev(1000s)<1
beyond all tau    |3|mtie\(4294967306s\)<1us cannot be computed|trace.csv --assert mtie(4294967306s)<1us
between intervals |3|tdev\(1500ms\)<1s cannot be computed|trace.csv --assert tdev(1500ms)<1s
without its slope |0|^longest stretch without a gap: 59 points$|trace.csv --remove-slope
no slope          |1|^dravik-host: one measurement has no slope$|trace.csv --from 20s --to 20s --remove-slope
nothing in time   |3|^dravik-host: limits of masks not checked: 1$|trace.csv --from 20s --to 20s --mask g8273.2-d
nothing selected  |1|^dravik-host: trace.csv has no measurement in that time$|trace.csv --from 1h
no unit           |2|'20' has no unit|trace.csv --assert rms<20
no figure         |2|'rmse' is none of rms, peak, |trace.csv --assert rmse<1ns
no tau            |2|'tdev' is none of|trace.csv --assert tdev<1ns
no limit          |2|'rms' is not FIGURE<LIMIT|trace.csv --assert rms
not plain         |2|'1ns' is not a plain number|trace.csv --assert adev(1s)<1ns
frequency of what |2|--frequency requires --interval|trace.csv --frequency
no numbers        |1|^dravik-host: trace.csv: line 1 is not one number$|trace.csv --interval 1s
no such mask      |2|--mask|trace.csv --mask g8273.2-e
mask held in part |3|^mask 802.1as +max .TE. 1000 ns +held +40 ns$|trace.csv --mask 802.1as
mask broken       |3|^mask g8273.2-c +max .TE. 30 ns +broken +40 ns$|trace.csv --mask g8273.2-c
not checked       |3|^mask g8273.2-a +constant TE 50 ns +not checked +less than 1000 s$|trace.csv --mask g8273.2-a
a line along tau   |3|^mask 802.1as +TDEV 5 ns per s of tau up to 10 s +broken +35\.12 ns at 1 s$|trace.csv --mask 802.1as
high pass         |3|^mask g8273.2-a +dTEH peak to peak 70 ns +held +48\.57 ns$|trace.csv --mask g8273.2-a
END
# A constant error passes a low pass whole and a high pass not at all; what alternates does neither.
for ((i = 0; i < 1200; ++i)); do echo 8e-9; done > constant
check "low pass" 3 '^mask g8273.2-d +max .TEL. 5 ns +broken +8 ns$' constant --interval 1s --mask g8273.2-d
check "constant" 0 '^mask g8273.2-c +constant TE 10 ns +held +8 ns$' constant --interval 1s --mask g8273.2-c
awk 'BEGIN { for (i = 0; i <= 1200; ++i) print i * 4.6e-11 }' > ramp
check "to the end of the mask" 3 '^mask g8273.2-a +dTEL MTIE up to 1000 s 40 ns +broken +46 ns at 1000 s$' ramp --interval 1s --mask g8273.2-a
for ((i = 0; i < 600; ++i)); do printf '2e-8\n-2e-8\n'; done > alternating
check "too slow a filter" 3 '^mask g8273.2-d +max .TEL. 5 ns +not checked +pairs too far apart' \
    alternating --interval 2s --mask g8273.2-d
sed -n '1!p' alternating | sed '1i 0' > centred
check "alternating" 0 '^mask g8273.2-d +max .TEL. 5 ns +held +[0-4]\.' centred --interval 100ms --mask g8273.2-d

echo "$checks checks, $failures failures"
exit $((failures > 0))
