#!/usr/bin/env bash
# Documents made to measure: what is found in traces, what the gains are, what they are worth.
# Usage: tune_test.sh FOLDER CC, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
host=(${EMULATOR:+"$EMULATOR"} "$(cd "$1" && pwd)/dravik-host")
source "$(dirname "$0")/support/expect.sh"
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
cd "$scratch" || exit 1

key() { sed -nE "s/^ *\"$1\": ([^,]*),?$/\1/p" "$2"; }

# Reports, the first one whole, of others what depends on a trace and on what is given with it.
echo '{"phaseLockGain": 0.1, "snapTimeThreshold": 1e-4}' > slow.json
simulate() { "${host[@]}" simulate --config slow.json --csv "$@" > out; }
simulate trace.csv --duration 1000s --noise 50ns --frequency-wander 1ppb
simulate short.csv --duration 120s --noise 50ns --outlier-rate 4% --outlier-size 3us --frequency-wander 1ppb
simulate steps.csv --duration 400s --noise 20ns --granularity 1us
simulate still.csv --duration 1000s --noise 0 --frequency-noise 20ppb
known=(--noise 50ns --wander 1ppb --interval 3s --outlier-rate 1% --outlier-size 2us --frequency-noise 2ppb)
"${host[@]}" tune "${known[@]}" -o tuned.json > report
expect "by what was given" "" "$(diff - report << 'END'
measurements of 50 ns every 3 s, 1 % of outliers of 2 us;
oscillator with 2 ppb of white noise at 1 s and 1 ppb of wander per root second
                            built-in    this one
error, RMS                  2.863 us    45.16 ns
error, peak                 13.09 us    309.7 ns
locks lost per hour              129           0
starts that fail, alone     30 of 30     1 of 30
kp, 1/s                         0.55       0.106
ki, 1/s per pair                0.55      0.0151
damping                            -        0.82
settles within                 never     72.21 s
noise that passes                  -        54 %
theory: error, RMS                      38.27 ns
slow to acquire; quicker with further documents, which --quick writes:
    --measure-over 6s --config QUICK --then 39s=tuned.json
END
)"
cat > wanted << 'END'
== trace.csv --quick q.json
measurements of 51.58 ns every 1 s;
oscillator with white noise that cannot be told from the measurements' and 1.01 ppb of wander per root second
    --measure-over 3s --config q.json --then 23s=DOCUMENT
== short.csv --frequency-noise 3ppb --interval 2s
measurements of 52.62 ns every 2 s, 0.84 % of outliers of 3 us;
oscillator with 3 ppb of white noise at 1 s and at most 2.38 ppb of wander per root second
! the trace is too short to tell the wander: 0 to 2.4 ppb per root second are possible;
! by theory that leaves an error of 15.45 ns to 43.02 ns RMS; take a longer trace or give --wander
    --measure-over 14s --config QUICK --then 112s=DOCUMENT
== short.csv --outlier-rate 0% --interval 999400us
measurements of 52.62 ns every 999.4 ms;
oscillator with 8.86 ppb of white noise at 1 s and at most 2.38 ppb of wander per root second
    --measure-over 2.9982s --config QUICK --then 25.9844s=DOCUMENT
== steps.csv --wander 20ppb --frequency-noise 3ppb --outlier-size 5us --outlier-rate 0.5%
measurements in steps of 1 us whose noise the steps hide, taken as 50 ns every 1 s, 0.5 % of outliers of 5 us;
oscillator with 3 ppb of white noise at 1 s and 20 ppb of wander per root second
    --measure-over 3s --config QUICK --then 22s=DOCUMENT
== still.csv
measurements whose noise cannot be told from the oscillator's every 1 s;
oscillator with 20.8 ppb of white noise at 1 s and at most 0.324 ppb of wander per root second
== still.csv --noise 3ns --interval 999500us
measurements of 3 ns every 1 s;
oscillator with 20.8 ppb of white noise at 1 s and at most 0.324 ppb of wander per root second
== --noise 10us --wander 1ppb --interval 1s -o quiet.json --quick quick.json
measurements of 10 us every 1 s;
oscillator with 0.1 ppb of white noise at 1 s and 1 ppb of wander per root second
    --measure-over 10s --config quick.json --then 95s=quick2.json --then 380s=quiet.json
END
sed -n 's/^== //p' wanted | while read -r arguments; do
    echo "== $arguments"
    # shellcheck disable=SC2086  # split on purpose
    "${host[@]}" tune $arguments 2>&1 | grep -E '^(meas|osc|!|    --)'
done > found
expect "reports" "" "$(diff wanted found)"
expect "all keys are taken" 11 "$("${host[@]}" check tuned.json | grep -c '":')"
"${host[@]}" tune "${known[@]}" > other.json 2> elsewhere
expect "to the standard output" "" "$(cmp tuned.json other.json; diff <(sed s/DOCUMENT/tuned.json/ elsewhere) report)"

if [ -z "${EMULATOR:-}" ]; then
    "${host[@]}" tune --noise 50ns --wander 1ppb --interval 1ms -o fast.json > out
    expect "quick gains beyond all documents" "0 11" "$? $(grep -c '":' fast.json)"
fi

# For the end of a row of clocks; what is best for one of them is not.
if [ -z "${EMULATOR:-}" ]; then
    "${host[@]}" tune --noise 50ns --wander 1ppb --interval 1s --hops 7 -o row.json > out
    expect "seventh clock, also with the loop for one" 2 "$(grep -cE out \
        -e '^error, RMS .* 6[0-3][.0-9]* ns +10[5-9][.0-9]* ns$' -e '^theory: .* 59.8[0-9]* ns +106.7 ns$')"
    "${host[@]}" simulate --hops 7 --noise 50ns --frequency-wander 1ppb --duration 4000s \
        --config row.json > out
    expect "seventh clock, simulated" 1 "$(grep -cE '^ +(5[0-9]|6[0-9]|7[0-5])[.0-9]* ns$' out)"
fi

# Acquired quickly and held quietly, by the very options that the report names.
# shellcheck disable=SC2046  # split on purpose
"${host[@]}" simulate --noise 10us --duration 2000s $(tail -n 1 found) > simulated
expect "quickly locked, then quiet" 2 "$(grep -cE '^lock +after (1?[0-9])\.000 s, lost 0 times|tuned by quiet.json' simulated)"

# A controller's constants, without a noise and with one.
"${host[@]}" tune --from-pi 0.1,1e-7 > pi.json
expect "without a noise" "0.1 1.000001 1e-06 0" "$(key phaseLockGain pi.json) $(key phaseLockCoefficientA pi.json) $(
    key snapTimeThreshold pi.json) $(key spikeFilterEnabled pi.json)"
"${host[@]}" tune --from-pi 0.7,0.3 --noise 100ns | cmp -s - <("${host[@]}" tune --from-pi 0.7,0.3)
expect "with half a noise" 0 $?
"${host[@]}" tune --from-pi 0.7,0.3 --noise 100ns --interval 1s > pi.json
expect "with a noise" "1.2e-06 1" "$(key snapTimeThreshold pi.json) $(key spikeFilterEnabled pi.json)"

# What a telecom boundary clock is to pass on.
for interval in 62.5ms 1s; do
    "${host[@]}" tune --bandwidth 0.05Hz --peaking 0.1dB --interval $interval --noise 50ns -o bandwidth.json
    expect "held at $interval" 1 "$("${host[@]}" simulate --interval $interval --noise 50ns --seed 3 \
        --config bandwidth.json | grep -c '^lock .* lost 0 times')"
    expect "bandwidth at $interval" 1 "$("${host[@]}" check bandwidth.json --interval $interval 2>&1 |
        grep -c '3 dB bandwidth 0.05 Hz, gain peaking 0.10 dB (meets G.8273.2')"
done

while IFS='|' read -r status pattern arguments; do
    # shellcheck disable=SC2086  # split on purpose
    "${host[@]}" tune $arguments > out 2> err
    expect "tune $arguments: exit status" "$status" $?
    expect "tune $arguments: $pattern" "1 1" "$(grep -cE -- "$pattern" err) $(wc -l < err)"
done << 'END'
2|A trace, or --noise, --wander and --interval, or --from-pi, or --bandwidth, is required|--noise 1ns
2|--from-pi: '1,-1' is not KP,KI|--from-pi 1,-1
2|--from-pi: '0,1' is not KP,KI|--from-pi 0,1
2|--from-pi: '1,0' is not KP,KI|--from-pi 1,0
2|--from-pi: '1,1,1' is not KP,KI|--from-pi 1,1,1
2|--quick: several documents take files|--noise 1ns --wander 1ppb --interval 1s --quick -
2|--from-pi: a trace has no say in it|trace.csv --from-pi 1,1
2|--from-pi: --hops has no say in it|--from-pi 1,1 --hops 2
2|--bandwidth: a trace has no say in it|trace.csv --bandwidth 1Hz --peaking 1dB --interval 1s
2|--bandwidth requires --peaking|--bandwidth 0.1Hz --interval 1s
1|every 1 s has a bandwidth of 0.5 Hz: .* half the rate|--bandwidth 0.5Hz --peaking 1dB --interval 1s
1|no document can have kp 60 and ki 50 per second|--from-pi 60,50
1|cannot read none|none
END
expect "a model of years" 1 "$("${host[@]}" tune --noise 1s --wander 0 --interval 24h 2>&1 |
    grep -c 'would average over 568 pairs, 568 days')"
head -n 40 trace.csv > few.csv
expect "too short" 1 "$("${host[@]}" tune few.csv 2>&1 | grep -c 'measurements, too few to tell')"

echo "$checks checks, $failures failures"
exit $((failures > 0))
