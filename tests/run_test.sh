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
    for ((wait = 0; wait < 200; ++wait)); do [ "$(found "$1")" == 0 ] && return; sleep 0.05; done
}

# Rows of NAME|STATUS|PATTERN|OPTIONS; noise cannot be foreseen here, so a threshold of 1 ms.
echo '{"snapTimeThreshold": 1e-3}' > calm.json
run=("${host[@]}" run --interval 20ms --config calm.json)
while IFS='|' read -r name status pattern options; do
    # shellcheck disable=SC2086  # split on purpose
    "${run[@]}" --duration 400ms $options > out 2>&1
    expect "$name: exit status" "$status" $?
    expect "$name: $pattern" 0 "$(found "$pattern")"
done << 'END'
locked              |0|^ +0\.[0-9]+ s  locked, error|
step held back      |1|a step by -[23][0-9.]* ms is larger than --max-step allows, \+1 ms|--max-step 1ms
step within limits  |0|stepped by -[23]|--max-step 5ms
nothing is ordered  |0|lock missed, error \+[23]\.[0-9]+ ms|--dry-run
sane                |0|lost 0 times|--sanity-limit 1000ppm --frequency-error 900ppm --max-frequency-offset 2000ppm
mad                 |0|the clock leapt by \+[0-9.]+ ms against CLOCK_MONOTONIC_RAW: measuring anew|--sanity-limit 1ppb --frequency-error 100000ppm --max-frequency-offset 200ppm
a line for each pair|0|^dravik-host\[0\.[0-9]{3}\]: offset +-?[0-9]+ s2 freq +[+-][0-9]+$|--status 0
a line now and then |0|^dravik-host\[0\.[0-9]{3}\]: rms +[0-9]+ max +[0-9]+ freq +[+-][0-9]+ \+/- +[0-9]+$|--status 100ms
no such metrics     |1|^dravik-host: cannot write none/m.new: No such file|--metrics none/m
END
"${run[@]}" --duration 400ms --status 0 --metrics figures > out
expect "its lines are a trace" "$(grep -c offset out)" "$("${host[@]}" replay out 2> err | sed -nE 's/^pairs +([0-9]+) .*/\1/p')"
expect "figures" "8 8 8" "$(grep -c '^# HELP' figures) $(grep -c '^# TYPE' figures) $(grep -cE '^dravik_[a-z_]+ -?[0-9.e-]+$' figures)"

# SIGHUP reads the documents again, and keeps the old ones if one of them is refused.
echo '{"snapTimeThreshold": 1e-3}' > live.json
"${host[@]}" run --interval 20ms --config live.json --no-step-after-lock --duration 30s > out 2>&1 & pid=$!
waitFor 'locked'
kill -HUP $pid
waitFor 'documents read again'
echo '{"snapTimeThreshold": 100}' > live.json
kill -HUP $pid
waitFor 'stay as they are'
echo '{"snapTimeThreshold": 1e-8, "phaseLockCoefficientC": -10}' > live.json # no lock withstands it
kill -HUP $pid
wait $pid
expect "no step after the lock: exit status" 1 $?
expect "no step after the lock" 0 "$(found 'a step by .* after the first lock')"
expect "SIGHUP" "2 1" "$(grep -c 'documents read again' out) $(grep -c 'documents stay as they are: live.json: refused' out)"

# SIGINT and SIGTERM end a run as its duration would.
for signal in INT TERM; do
    "${host[@]}" run > out & pid=$!
    waitFor run
    kill -$signal $pid
    wait $pid
    expect "SIG$signal: exit status" 0 $?
    expect "SIG$signal: summary" 1 "$(grep -c '^host calls' out)"
done

echo "$checks checks, $failures failures"
exit $((failures > 0))
