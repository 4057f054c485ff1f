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

# Noise found in a trace, whatever loop made it.
echo '{"phaseLockGain": 0.1, "snapTimeThreshold": 1e-4}' > slow.json
"${host[@]}" simulate --duration 1000s --noise 50ns --frequency-wander 1ppb --config slow.json \
    --csv trace.csv > out
"${host[@]}" tune trace.csv -o tuned.json > out
between "noise" 45 55 "$(sed -nE 's/^measurements of ([0-9.]+) ns every 1 s;$/\1/p' out)"
between "wander" 0.6 1.4 "$(sed -nE 's/^oscillator .* and ([0-9.]+) ppb of wander per root second$/\1/p' out)"

# By what was given; the report goes where the document does not.
"${host[@]}" tune --noise 50ns --wander 1ppb --interval 1s -o tuned.json > out
between "kp" 0.17 0.20 "$(key phaseLockGain tuned.json)"
between "error" 23 25 "$(sed -nE 's/^error, RMS .* ([0-9.]+) ns$/\1/p' out)"
between "theory" 23.4 23.6 "$(sed -nE 's/^theory: .* ([0-9.]+) ns$/\1/p' out)"
expect "a start with it alone" 1 "$(grep -cE '^starts that fail, alone +0 of 30 +[0-9]+ of 30$' out)"
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

# A controller's constants, without a noise and with one.
"${host[@]}" tune --from-pi 0.1,1e-7 > pi.json
expect "without a noise" "0.1 1.000001 1e-06 0" "$(key phaseLockGain pi.json) $(key phaseLockCoefficientA pi.json) $(
    key snapTimeThreshold pi.json) $(key spikeFilterEnabled pi.json)"
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
2|--from-pi: '0,1' is not KP,KI|--from-pi 0,1
2|--from-pi: '1,1,1' is not KP,KI|--from-pi 1,1,1
2|--quick: several documents take files|--noise 1ns --wander 1ppb --interval 1s --quick -
2|--from-pi: a trace has no say in it|trace.csv --from-pi 1,1
1|no document can have kp 60 and ki 50 per second|--from-pi 60,50
1|cannot read none|none
END
expect "a model of years" 1 "$("${host[@]}" tune --noise 1s --wander 0 --interval 24h 2>&1 |
    grep -c 'would average over 568 pairs, 568 days')"
awk -F, 'BEGIN { print "reference_ns,clock_ns" }
    $1 == "pair" { printf "%.0f,%.0f\n", n * 999980000, n * 999980000 + $5; n++ }' trace.csv > fast.csv
expect "the mean spacing, in seconds" 1 "$("${host[@]}" tune fast.csv --free-running 2>&1 |
    grep -cE '^measurements of [0-9.]+ ns every 1 s;')"
head -n 40 trace.csv > short.csv
expect "too short" 1 "$("${host[@]}" tune short.csv 2>&1 | grep -c 'measurements, too few to tell')"

echo "$checks checks, $failures failures"
exit $((failures > 0))
