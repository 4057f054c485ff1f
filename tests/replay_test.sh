#!/usr/bin/env bash
# Recorded traces: every format to the digit, what is not read, and both ways of running on them.
# Usage: replay_test.sh FOLDER CC, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
host=(${EMULATOR:+"$EMULATOR"} "$1/dravik-host")
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
source "$(dirname "$0")/support/expect.sh"

replay() { "${host[@]}" replay "$@"; }
pairs() { replay - --csv - "$@" 2> /dev/null | grep '^pair' | cut -d, -f2-6; }
messages() { { replay - "$@" > /dev/null; } 2>&1; }

# Sources. Each trace has the same two measurements, 8 ns apart in 1.5 s, and lines to be left out.
wanted="0.000000000,1700003531420000000,1700003531419999977,-23,
1.500000000,1700003532920000000,1700003532919999985,-15,"
daemon() { # PREFIX CLOCK WORDS
    cat << END
$1[3531.420]: $2offset        -23 s2 freq  +12345 $3
$1[3532.100]: ${2}offset          1 s2 freq
$1[3532.200]: ${2}offset 1e3 s2 freq +1 $3
$1[3531.420]: ${2}offset         77 s2 freq  +12345 $3
$1[3532.300]: ${2}offset        77 s2 freq  +12345x
$1[3532.920]: ${2}offset        -15 s3 freq      +7 $3
END
}
expect "its lines not used" "dravik-host: the standard input: 4 lines are not used, the first are lines 2 (cut short), 3 (the offset is no number), 4 (time does not advance)" \
    "$(daemon ptp4l 'master ' '' | messages)"
expect "several clocks" "dravik-host: the standard input has several sources, choose one by --source: 'ptp4l', 'phc2sys CLOCK_REALTIME'" \
    "$( (daemon ptp4l 'master ' ''; daemon phc2sys 'CLOCK_REALTIME phc ' '') | messages | tail -n 1)"
expect "one of several" "$wanted" \
    "$( (daemon phc2sys 'eth1 sys ' ''; daemon phc2sys 'CLOCK_REALTIME phc ' '') | pairs --source REALTIME)"
expect "the one of that very name" "$wanted" \
    "$( (daemon ts2phc '/dev/ptp10 master ' ''; daemon ts2phc '/dev/ptp1 master ' '') | pairs --source 'ts2phc /dev/ptp1')"
expect "a host of another's name" "$wanted" \
    "$(daemon phc2sys 'eth0 sys ' '' | sed -E 's/^phc2sys(.*\]):/Nov 23 08:35:26 ptp4l-gw phc2sys[812]: \1/' | pairs --source phc2sys)"
expect "none of them" "dravik-host: the standard input has no source 'eth2', but 'ptp4l'" \
    "$(daemon ptp4l 'master ' '' | messages --source eth2 | tail -n 1)"

sums() { printf "$1[%d.000]: ${2}rms 10 max 20 freq +100 +/- 10 delay 5 +/- 0\n" 1 2; }
expect "summaries only" "dravik-host: the standard input has summaries only; ptp4l prints each measurement with summary_interval -7 (phc2sys with -u 0)
dravik-host: the standard input has summaries only; phc2sys prints each measurement with -u 0
dravik-host: the standard input has summaries only; run prints each measurement with --status 0" \
    "$(sums ptp4l '' | messages; sums phc2sys 'CLOCK_REALTIME ' | messages; sums dravik-host '' | messages)"
expect "time that goes back" "dravik-host: the standard input: the time starts anew, as after a reboot, so there are 2 stretches
dravik-host: the standard input: only the longest stretch is used, 3 of 4 measurements" \
    "$(printf 'ptp4l[%d.000]: master offset 9 s2 freq +0 path delay 5\n' 10 3 4 5 | messages)"
peerstats=$'61099 1.5 a 9624 0.000000023 0.0 0.0\n61099 3.0 a 9624 0.000000015 0.0 0.0'
expect "no corrections" "dravik-host: the standard input does not tell what frequency the clock was given, so its corrections cannot be undone" \
    "$(messages --re-discipline <<< "$peerstats" | sed -n 's/; if it had.*//p')"
expect "a clock that had none" "0.000000000 -23
1.500000000 -15" "$(pairs --re-discipline --free-running <<< "$peerstats" | cut -d, -f1,4 | tr , ' ')"

# Verbatim, the plug-in orders what it ordered when the trace was made, bit by bit; re-disciplined,
# the same document leads to the same errors, and another one to its own.
echo '{"phaseLockGain": 0.1, "snapTimeThreshold": 1e-3}' > "$scratch/slow.json"
simulate=("${host[@]}" simulate --duration 1h --seed 3)
"${simulate[@]}" --csv "$scratch/quick.csv" > "$scratch/out"
"${simulate[@]}" --csv "$scratch/slow.csv" --config "$scratch/slow.json" > "$scratch/out"
replay "$scratch/quick.csv" --csv "$scratch/again.csv" > "$scratch/out"
expect "verbatim" "" "$(cmp "$scratch/quick.csv" "$scratch/again.csv")"
expect "verbatim says so" 1 "$(grep -c "verbatim: errors as recorded" "$scratch/out")"
furthest() { # ONE OTHER: the largest distance between their errors, once both are locked
    paste -d, "$1" "$2" | awk -F, '/^pair/ && $2 > 9 {d = $5 - $13; m = d > m ? d : -d > m ? -d : m} END {print m + 0}'
}
for document in quick slow; do
    config=()
    [ $document == slow ] && config=(--config "$scratch/slow.json")
    replay "$scratch/quick.csv" --re-discipline --csv "$scratch/freed.csv" "${config[@]}" > "$scratch/out"
    grep '^pair' "$scratch/freed.csv" > "$scratch/freed"
    grep '^pair' "$scratch/$document.csv" > "$scratch/made"
    expect "re-disciplined, $document" yes \
        "$([ "$(furthest "$scratch/freed" "$scratch/made")" -le 10 ] && echo yes)"
done
expect "re-disciplined says so" 1 "$(grep -c "re-disciplined: recorded corrections undone" "$scratch/out")"

# A daemon's own loop, with the step of its state s1, undone: what is left is the oscillator.
expect "a daemon's corrections undone" "0.000000000 1000
1.000000000 13000
2.000000000 25000
3.000000000 27000" "$(replay - --re-discipline --max-frequency-offset 1ppb --csv - << 'END' 2> /dev/null |
ptp4l[10.000]: master offset       1000 s0 freq       +0 path delay 1
ptp4l[11.000]: master offset      13000 s1 freq   +12000 path delay 1
ptp4l[12.000]: master offset          0 s2 freq   +12000 path delay 1
ptp4l[13.000]: master offset     -10000 s2 freq   +12000 path delay 1
END
    awk -F, '/^pair/ {e = $5 + u; print $2, 100 * int(e / 100 + 0.5)} /setFrequency/ {u -= $8} /stepTime/ {u -= $8}')"

echo "$checks checks, $failures failures"
exit $((failures > 0))
