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

between() { # NAME LEAST MOST FOUND
    expect "$1: $4 within $2 to $3" 1 "$(awk -v x="$4" 'BEGIN {print (x != "" && x >= '"$2"' && x <= '"$3"')}')"
}
key() { sed -nE "s/^ *\"$1\": ([^,]*),?$/\1/p" "$2"; }

# Noise found in a trace, whatever loop made it: rows of NAME|NOISE OPTIONS|LOOP OPTIONS|the figures
# of the report with their bounds, a pattern before each.
echo '{"phaseLockGain": 0.1, "snapTimeThreshold": 1e-4}' > slow.json
while IFS='|' read -r name noise loop figures; do
    # shellcheck disable=SC2086  # split on purpose
    "${host[@]}" simulate --duration 5000s $noise $loop --csv trace.csv > out
    "${host[@]}" tune trace.csv -o tuned.json > out
    while read -r pattern least most; do
        between "$name: $pattern" "$least" "$most" \
            "$(sed -nE "s/.*${pattern//_/ }.*/\1/p" out)"
    done <<< "${figures//;/$'\n'}"
    [ -z "${EMULATOR:-}" ] || break # which is slow
done << 'END'
quiet|--noise 50ns --frequency-wander 1ppb|--seed 2|of_([0-9.]+)_ns_every_1_s 48 52;and_([0-9.]+)_ppb_of_wander 0.8 1.2
slow loop|--noise 50ns --frequency-wander 1ppb --interval 2s|--config slow.json|of_([0-9.]+)_ns_every_2_s 48 52;and_([0-9.]+)_ppb_of_wander 0.8 1.2
white frequency|--noise 5ns --frequency-noise 20ppb --frequency-wander 1ppb|--seed 4|of_([0-9.]+)_ns_every 3.5 6.5;with_([0-9.]+)_ppb 18 22
outliers|--noise 50ns --frequency-wander 1ppb --outlier-rate 2% --outlier-size 3us|--config slow.json|of_([0-9.]+)_ns_every 48 52;_([0-9.]+)_%_of_outliers 1.5 2.5;outliers_of_([0-9.]+)_us 2.9 3.1
END

# The steady-state filter of 50 ns and 1 ppb at 1 s has gains of 0.184 and 0.0188 and an error of
# 23.8 ns; simulations, the rounding included, come near.
"${host[@]}" tune --noise 50ns --wander 1ppb --interval 1s -o tuned.json > out
between "kp" 0.17 0.20 "$(key phaseLockGain tuned.json)"
between "ki over kp" 1.08 1.12 "$(key phaseLockCoefficientA tuned.json)"
between "error" 23 25 "$(sed -nE 's/^error, RMS .* ([0-9.]+) ns$/\1/p' out)"
between "theory" 23.7 23.9 "$(sed -nE 's/^theory: .* ([0-9.]+) ns$/\1/p' out)"
expect "all keys are taken" 11 "$("${host[@]}" check tuned.json | grep -c '":')"
"${host[@]}" tune --noise 50ns --wander 1ppb --interval 1s > other.json 2> report
expect "to the standard output" "" "$(cmp tuned.json other.json; diff <(sed s/DOCUMENT/tuned.json/ report) out)"

if [ -z "${EMULATOR:-}" ]; then
    "${host[@]}" tune --noise 50ns --wander 1ppb --interval 1ms -o fast.json > out
    expect "quick gains beyond all documents" "0 11" "$? $(grep -c '":' fast.json)"
fi

# Acquired quickly and held quietly, by the very options that the report names.
"${host[@]}" tune --noise 10us --wander 1ppb --interval 1s -o quiet.json --quick quick.json > out
# shellcheck disable=SC2046  # split on purpose
"${host[@]}" simulate --noise 10us --duration 2000s $(tail -n 1 out) > simulated
between "quickly locked" 3 20 "$(sed -nE 's/^lock +after ([0-9.]+) s, lost 0 times.*/\1/p' simulated)"
expect "then quiet" 1 "$(grep -c 'tuned by quiet.json' simulated)"

# A controller's constants: gain, A, B, C; and the yardstick that it is gives the same summary.
while read -r controller wanted; do
    "${host[@]}" tune --from-pi "$controller" > pi.json
    expect "from $controller" "$wanted" "$(key phaseLockGain pi.json) $(key phaseLockCoefficientA pi.json) $(
        key phaseLockCoefficientB pi.json) $(key phaseLockCoefficientC pi.json)"
done << 'END'
0.7,0.3 0.7 1.42857142857 1 1
0.1,1e-7 0.1 1.000001 1 1
0.01,0.99 0.1 10 0.1 1
20,5 10 2.5 2 1
END
"${host[@]}" tune --from-pi 0.7,0.3 --noise 100ns --interval 1s > pi.json
expect "with a noise" "1.2e-06 1" "$(key snapTimeThreshold pi.json) $(key spikeFilterEnabled pi.json)"

while IFS='|' read -r status pattern arguments; do
    # shellcheck disable=SC2086  # split on purpose
    "${host[@]}" tune $arguments > out 2> err
    expect "tune $arguments: exit status" "$status" $?
    expect "tune $arguments: $pattern" "1 1" "$(grep -cE -- "$pattern" err) $(wc -l < err)"
done << 'END'
2|A trace, or --noise, --wander and --interval, or --from-pi is required|--noise 1ns
2|--from-pi: '1,-1' is not KP,KI|--from-pi 1,-1
2|--from-pi: '1,1,1' is not KP,KI|--from-pi 1,1,1
2|--quick: several documents take files|--noise 1ns --wander 1ppb --interval 1s --quick -
2|--from-pi: a trace has no say in it|trace.csv --from-pi 1,1
1|no document can have kp 60 and ki 50 per second|--from-pi 60,50
1|cannot read none|none
END
head -n 40 trace.csv > short.csv
expect "too short" 1 "$("${host[@]}" tune short.csv 2>&1 | grep -c 'measurements, too few to tell')"

echo "$checks checks, $failures failures"
exit $((failures > 0))
