#!/usr/bin/env bash
# Runs in real time from references of every kind, and on clocks that the kernel keeps, for which a
# library of our own stands in: no clock of the machine is touched.
# Usage: live_test.sh FOLDER CC, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
host=(${EMULATOR:+"$EMULATOR"} "$(cd "$1" && pwd)/dravik-host")
support=$(cd "$(dirname "$0")/support" && pwd)
source "$support/expect.sh"
scratch=$(mktemp -d)
unit=$((200 + RANDOM % 50))
dropSegment() { ipcrm -M $((0x4e545030 + unit)) 2> /dev/null; }
trap 'dropSegment; rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
cd "$scratch" || exit 1
"$2" -O1 -o producer "$support/producer.c" || exit 1
source "$support/kernel_clocks.sh"
produce() { ${EMULATOR:+"$EMULATOR"} ./producer "$@"; }

found() { grep -qE -- "$1" out; echo $?; }
waitFor() { for ((n = 0; n < 500; ++n)); do "$@" && return; sleep 0.02; done; }
begin() { # OPTION...: in the background, until it is up
    rm -f out
    "${run[@]}" --duration 60s "$@" > out 2>&1 & pid=$!
    waitFor grep -qs run: out
}
echo '{"snapTimeThreshold": 1e-3}' > calm.json
run=("${host[@]}" run --config calm.json)

# Segments and sockets of a producer that is 5 ms ahead of the machine, the clock starting 3 ms ahead.
while read -r unusable name target how detail; do
    [ "$name" != shm ] || produce shm "$unit" "$how" "$detail" 0 # makes the segment
    begin --reference "$name:$target"
    produce "$name" "$target" "$how" "$detail" 60
    expect "$name $how $detail: produced" 0 $?
    kill $pid
    wait $pid
    expect "$name $how $detail: exit status" 0 $?
    expect "$name $how $detail: stepped onto it" 0 "$(found '^ +[0-9.]+ s  stepped by \+[0-9.]+ ms')"
    expect "$name $how $detail: held" 0 "$(found 'lost 0 times; [0-9]+ pairs')"
    expect "$name $how $detail: left out" 0 "$(found "samples: [0-9]+ out of date, $unusable not usable")"
    dropSegment
done << END
1 shm $unit wide 0
1 shm $unit wide 1
1 shm $unit narrow 0
1 shm $unit narrow 1
2 sock ./here wide 0
2 sock ./here narrow 1
END
expect "socket: gone" 1 "$([ -e here ]; echo $?)"
"${run[@]}" --reference "shm:$unit" --duration 20ms > /dev/null
expect "segment: made for a producer to come" 0 "$(dropSegment; echo $?)"

# A reference that falls silent for too long, and a socket that another run left behind.
begin --reference sock:here --holdover-after 200ms --remeasure-after 300ms --status 0
"${run[@]}" --reference sock:here > taken 2>&1
expect "socket in use" "1 dravik-host: cannot make the socket here: Address already in use" "$? $(cat taken)"
produce sock here wide 0 30
sleep 0.4
produce sock here wide 0 30
kill -9 $pid
wait $pid 2> /dev/null
expect "error told meanwhile" 0 "$(found '^dravik-host\[[0-9.]+\]: holdover for [0-9.]+ ms, error about [0-9.]+ .s$')"
expect "silence" 0 "$(found 'reference is silent: holding the frequency')"
expect "its end" 0 "$(found 'reference is back after [0-9.]+ ms: measuring anew')"
expect "measured twice" 2 "$(grep -c 'frequency measured' out)"
"${run[@]}" --reference sock:here --duration 10ms > out
expect "socket left behind" "0 1" "$? $([ -e here ]; echo $?)"
echo precious > file
"${run[@]}" --reference sock:file --duration 10ms > out 2>&1
expect "a file of that name" "1 precious" "$? $(cat file)"

# Clocks of the kernel. Nothing is steered before it is certain that the library stands in for it.
kernel=("${run[@]}" --interval 20ms --duration 700ms)
touch ptp
underKernelClocks "" "${kernel[@]}" --reference phc:ptp --clock realtime --dry-run --csv seen > out 2>&1
expect "stand-in" 0 "$(grep -q ',1000000000[0-9]*,' seen; echo $?)"
if [ $failures == 0 ]; then
    while IFS='|' read -r letters status pattern options; do
        # shellcheck disable=SC2086  # split on purpose
        underKernelClocks "$letters" "${kernel[@]}" $options > out 2>&1
        expect "kernel $letters $options: exit status" "$status" $?
        expect "kernel $letters $options: $pattern" 0 "$(found "$pattern")"
    done << 'END'
 |0|stepped by \+1e\+09 s|--reference phc:ptp --clock realtime
 |0|stepped by -1e\+09 s|--reference realtime --clock phc:ptp
e|0|lost 0 times; [0-9]+ pairs|--reference realtime --clock phc:ptp
b|0|lost 0 times; [0-9]+ pairs|--reference realtime --clock phc:ptp
 |0|stepped by \+9.99e\+08 s|--reference phc:ptp --clock realtime --reference-offset -1000000s
 |0|lost 0 times; [0-9]+ pairs|--reference phc:ptp
p|1|cannot set the frequency of CLOCK_REALTIME, which takes CAP_SYS_TIME: Operation not permitted|--reference phc:ptp --clock realtime
c|1|CLOCK_REALTIME took an offset of -?10000 ppb for -?[0-9]+ ppb|--reference phc:ptp --clock realtime
r|1|cannot set the frequency of ptp: Numerical result out of range|--reference realtime --clock phc:ptp
c|0|at its limit, [+-]10.000 ppm|--reference realtime --clock phc:ptp --max-frequency-offset 10ppm
END
fi

# What cannot be opened, and what makes no sense. Rows of STATUS|PATTERN|OPTIONS.
while IFS='|' read -r status pattern options; do
    # shellcheck disable=SC2086
    "${run[@]}" --duration 20ms $options > out 2>&1
    expect "$options: exit status" "$status" $?
    expect "$options: one line" 1 "$(wc -l < out)"
    expect "$options: $pattern" 0 "$(found "^dravik-host: $pattern")"
done << 'END'
1|cannot open none: No such file|--reference phc:none
1|ptp is not a PTP clock: |--clock phc:ptp
1|cannot make the socket none/s: No such file|--reference sock:none/s
2|--reference: 'shm:256' is not a reference|--reference shm:256
2|--reference: 'gps' is not a reference|--reference gps
2|--clock: 'phc:' is not a clock|--clock phc:
2|--clock: realtime is its own reference|--clock realtime
2|--interval: shm:1 has a pace of its own|--reference shm:1 --interval 1s
2|--initial-offset: only the soft clock|--reference shm:1 --clock realtime --initial-offset 1s
END

echo "$checks checks, $failures failures"
exit $((failures > 0))
