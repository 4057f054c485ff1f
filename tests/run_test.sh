#!/usr/bin/env bash
# Runs in real time, on the program's own clock: how they end, what they protect and what they tell.
# Usage: run_test.sh FOLDER CC, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
host=(${EMULATOR:+"$EMULATOR"} "$(cd "$1" && pwd)/dravik-host")
source "$(dirname "$0")/support/expect.sh"
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
cd "$scratch" || exit 1

found() { grep -qE -- "$1" "${2:-out}"; echo $?; }
waitFor() { # PATTERN: until it is in the output of the run in the background
    for ((wait = 0; wait < 200; ++wait)); do [ "$(found "$1" 2> /dev/null)" == 0 ] && return; sleep 0.05; done
}

# Rows of NAME|STATUS|PATTERN|OPTIONS; noise cannot be foreseen here, so a threshold of 1 ms.
echo '{"snapTimeThreshold": 1e-3}' > calm.json
run=("${host[@]}" run --interval 20ms --config calm.json)
while IFS='|' read -r name status pattern options; do
    # shellcheck disable=SC2086  # split on purpose
    "${run[@]}" --duration 600ms $options > out 2>&1
    expect "$name: exit status" "$status" $?
    expect "$name: $pattern" 0 "$(found "$pattern")"
done << 'END'
locked              |0|^ +0\.[0-9]+ s  locked, error|
step held back      |1|refused a step of -[23][0-9.]* ms: --max-step is 1 ms|--max-step 1ms
step within limits  |0|stepped by -[23]|--max-step 5ms
nothing is ordered  |0|lock missed, error \+[23]\.[0-9]+ ms|--dry-run
sane                |0|lost 0 times|--sanity-limit 1000ppm --frequency-error 900ppm --max-frequency-offset 2000ppm
mad                 |0|the clock leapt by \+[0-9.]+ ms against CLOCK_MONOTONIC_RAW: measuring anew|--sanity-limit 1ppb --frequency-error 100000ppm --max-frequency-offset 200ppm
a line for each pair|0|^dravik-host\[0\.[0-9]{3}\]: offset +-?[0-9]+ s2 freq +[+-][0-9]+$|--status 0
a line now and then |0|^dravik-host\[0\.[0-9]{3}\]: rms +[0-9]+ max +[0-9]+ freq +[+-][0-9]+ \+/- +[0-9]+$|--status 100ms
metrics to a stream |2|^dravik-host: --metrics: the figures are replaced as a whole|--metrics -
no such metrics     |1|^dravik-host: cannot write none/m.new: No such file|--metrics none/m
END
"${run[@]}" --duration 400ms --status 0 --metrics figures > out
expect "its lines are a trace" "$(grep -c offset out)" "$("${host[@]}" replay out 2> err | sed -nE 's/^pairs +([0-9]+) .*/\1/p')"
expect "the step among them" "1 0" "$(grep -c ' s1 ' out) $("${host[@]}" replay out --re-discipline --config calm.json 2> err | grep -c missed)"
expect "figures" "8 8 8" "$(grep -c '^# HELP' figures) $(grep -c '^# TYPE' figures) $(grep -cE '^dravik_[a-z_]+ -?[0-9.e-]+$' figures)"

# A reference that is read seldom is not silent in between.
"${host[@]}" run --interval 150ms --holdover-after 50ms --remeasure-after 60ms --config calm.json --duration 1s > out
expect "seldom, but not silent" "0 1" "$(grep -cE 'reference is (silent|back)' out) $(grep -c 'lost 0 times' out)"

# A dry run is the trace of a free-running clock, and says what would have been ordered.
"${run[@]}" --duration 600ms --dry-run --csv dry.csv > out
expect "orders held back" "1 0" "$(($(grep -c '^held,.*setFrequency' dry.csv) > 0)) $(grep -cE '^call,.*(setF|step)' dry.csv)"
"${host[@]}" replay dry.csv --re-discipline --config calm.json > out
expect "its trace" 0 "$(found 'lost 0 times; 2[0-9] pairs')"

# SIGHUP reads the documents again, and keeps the old ones if one of them is refused.
echo '{"snapTimeThreshold": 1e-3}' > live.json
rm out
"${host[@]}" run --interval 20ms --config live.json --no-step-after-lock --duration 30s > out 2>&1 & pid=$!
waitFor 'locked'
kill -HUP $pid
waitFor 'documents read again'
echo '{"snapTimeThreshold": 100}' > live.json
kill -HUP $pid
waitFor 'stay as they are'
echo '{"phaseLockCoefficientC": -10}' > live.json # swings by 10 us: too much without the 1 ms
kill -HUP $pid
wait $pid
expect "no step after the lock: exit status" 1 $?
expect "no step after the lock" 0 "$(found 'refused a step of .* after the first lock')"
expect "SIGHUP" "2 1" "$(grep -c 'documents read again' out) $(grep -c 'documents stay as they are: live.json: refused' out)"

# SIGINT and SIGTERM end a run as its duration would.
for signal in INT TERM; do
    rm out
    "${host[@]}" run --duration 60s > out & pid=$!
    waitFor run
    kill -$signal $pid
    wait $pid
    expect "SIG$signal: exit status" 0 $?
    expect "SIG$signal: summary" 1 "$(grep -c '^host calls' out)"
done

echo "$checks checks, $failures failures"
exit $((failures > 0))
