#!/usr/bin/env bash
# The simulated machine itself: that no program under it can set a clock of the real one, and that it
# is what its statements say.
# Usage: simulated_machine_test.sh FOLDER, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
bin=$(cd "$1" && pwd)
support=$(cd "$(dirname "$0")/support" && pwd)
# shellcheck source-path=SCRIPTDIR source=support/expect.sh
source "$support/expect.sh"
# shellcheck source-path=SCRIPTDIR source=support/simulated.sh
source "$support/simulated.sh"
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
cd "$scratch" || exit 1

# Past the library the kernel refuses, but for the emulator's, which lacks the permission.
: > machine
if [ -z "${EMULATOR:-}" ]; then
    refused='Operation not permitted'
    expect "refused" "clock_settime: $refused
settimeofday: $refused
adjtimex: $refused
clock_adjtime: $refused
PTP device: $refused
syscall(): $refused
/dev/ptp9: Permission denied
/dev/rtc0: Permission denied" "$(simulated "$bin/../tests/clock_setter")"
    expect "its children too" "adjtimex: $refused" \
        "$(simulated bash -c "'$bin/../tests/clock_setter'" | grep ^adjtimex)"
else
    expect "refused" 1 \
        "$(simulated "$EMULATOR" "$bin/dravik-host" doctor 2>&1 | grep -c 'no CAP_SYS_TIME')"
fi

# Noise is the same bytes again from its seed, and other ones from another.
noisy() { # SEED
    simulatedHost "seed $1;system white=1ppb wander=1ppb;ptp ptp noise=50ns outliers=0.1 size=1us" \
        run --reference phc:ptp --clock realtime --duration 20s --csv - 2> /dev/null
}
first=$(noisy 1)
expect "samples" 160 "$(grep -c ^pair <<< "$first")"
expect "the same again" "$first" "$(noisy 1)"
expect "another seed" 1 "$([ "$first" != "$(noisy 2)" ] && echo 1)"

# A scenario, seen by a program that leaves the clock alone: statistics of what it measures, in ns.
: > scenario
played() { # SCENARIO SOURCE [STATEMENTS]: a line break for each ;
    tr ';' '\n' <<< "$1" > scenario
    simulatedHost "trace true.csv;shm 0;ptp ptp;scenario scenario system ${2#*:}" run --reference "$2" \
        --clock realtime --dry-run --duration 2000s --csv seen.csv > out 2>&1
    [ -s seen.csv ] && ${EMULATOR:+"$EMULATOR"} "$bin/dravik-host" metrics seen.csv --from 0s > figures
}
figure() { # NAME
    case $1 in
    last) awk -F, '$1 == "pair" {last = $5} END {print last}' seen.csv ;;
    true) awk -F, '$2 == "system" {last = $3} END {print last}' true.csv ;;
    tdev) awk '$3 == 8 {print $7 * ($8 == "us" ? 1000 : 1)}' figures ;;
    adev) awk '$3 == 8 {print $5 * 1e9}' figures ;;
    *) awk -F, -v what="$1" '$1 == "pair" {++n; sum += $5; squares += $5 * $5}
        END {print what == "count" ? n : what == "mean" ? sum / n : sqrt(squares / n - sum * sum / n / n)}' seen.csv ;;
    esac
}
while IFS='|' read -r source name wanted tolerance scenario; do
    played "$scenario" "$source"
    found=$(figure "$name")
    expect "$name of '$scenario' is $found, wanted $wanted" 0 \
        "$(awk "BEGIN {d = $found - $wanted; print !(d * d <= $tolerance * $tolerance)}")"
done << 'END'
shm:0|deviation|1000|50|reference interval=1s noise=1us
shm:0|mean|1000|70|reference interval=1s delay=1us # late, so the clock seems ahead
shm:0|mean|100|20|reference interval=1s delayed=10% size=1us
shm:0|count|1500|60|reference interval=1s missing=25%
shm:0|tdev|1000|120|reference interval=1s flicker=1us
shm:0|adev|10|1.5|reference interval=1s;clock flicker=10ppb
shm:0|deviation|707|40|reference interval=1s;at 1000s reference noise=1us
shm:0|count|2990|2|reference interval=1s;at 1000s reference interval=500ms;at 1500s silence;at 1505s resume
shm:0|last|-10000|1|reference interval=1s;at 1000s jump 10us
shm:0|true|-10000|1|reference interval=1s;at 1000s jump 10us;at 1500s clock frequency=0
shm:0|last|3000|1|clock offset=1us;reference interval=1s;at 1000s clock offset=2us
shm:0|last|150000|100|clock frequency=100ppb;reference interval=1s;at 1000s clock frequency=-50ppb
shm:0|last|95000|200|reference interval=1s;at 1000s clock ramp=1ppb;at 1100s clock ramp=0
shm:0|last|63662|20|reference interval=1s;clock sine=50ppb period=4000s
phc:ptp|last|-10000|1|at 1000s jump 10us
phc:ptp|mean|10|3|reference delay=10ns
phc:ptp|last|-9900|0|reference granularity=100ns;at 1000s jump 9950ns
END
errorsBy() { # SOURCE FIRST: four, from that pair on
    played 'reference interval=1s noise=1us' "$1"
    awk -F, -v first="$2" '$1 == "pair" && ++pairs >= first && pairs < first + 4 {print $5}' seen.csv
}
# The first sample of a segment is there before anybody looks at the clock.
expect "the same noise by both ways" "$(errorsBy shm:0 1)" "$(errorsBy phc:ptp 2)"
while IFS='|' read -r why scenario; do
    played "$scenario" shm:0
    expect "refused: $scenario" "simulated machine: scenario:$why" "$(cat out)"
done << 'END'
2: unknown: max|clock white=1ppb;clock max=1
1: not a quantity: 1m|reference noise=1m
2: before the statement above it: 4s|at 5s silence;at 4s resume
1: unknown: explode|at 5s explode
1: too much: 9s|at 5s silence 9s
2: comes after statements with a time: clock|at 5s silence;clock white=1ppb
END

echo "$checks checks, $failures failures"
exit $((failures > 0))
