#!/usr/bin/env bash
# Runs on the program's own clock under a simulated machine: what the servo does, how runs end, what
# they protect and what they show. Only the last one takes real time.
# Usage: run_test.sh FOLDER, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
bin=$(cd "$1" && pwd)
support=$(cd "$(dirname "$0")/support" && pwd)
# shellcheck source-path=SCRIPTDIR source=support/expect.sh
source "$support/expect.sh"
# shellcheck source-path=SCRIPTDIR source=support/simulated.sh
source "$support/simulated.sh"
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
cd "$scratch" || exit 1

# The clock starts 3 ms ahead and 12 ppm fast. Samples before the first pair have the first of the errors.
printf "%s\n" 30 -10 20 -40 0 > errors
printf "%s\n" -10 20 -40 0 30 > readings
echo '{"snapTimeThreshold": 1e-3}' > calm.json
cp calm.json live.json
mkdir folder
# shellcheck disable=SC2317  # called in the blocks
figures() { sed -n 's/^dravik_//p' "$@"; }
replay() { "${EMULATOR:-env}" "$bin/dravik-host" replay "$@" 2> /dev/null; }
expectRuns << 'END'
== a line for each pair | ptp ref errors=readings | --reference phc:ref --interval 1s --duration 9s --config calm.json --status 0 --metrics m --csv trace | figures m; grep -c '^# HELP' m; grep -c '^# TYPE' m; tail -3 trace
dravik-host[0.000]: offset    3000010 s0 freq      +0
     1.000 s  frequency measured: +11.970 ppm off, now steered by -11.970 ppm
dravik-host[1.000]: offset    3011980 s0 freq  +11970
     2.000 s  stepped by -3.012 ms
dravik-host[2.000]: offset    3012069 s1 freq  +11970
     3.000 s  locked, error -10 ns
dravik-host[3.000]: offset        -10 s2 freq  +11959
dravik-host[4.000]: offset          1 s2 freq  +11965
dravik-host[5.000]: offset         76 s2 freq  +12048
dravik-host[6.000]: offset         -3 s2 freq  +12003
dravik-host[7.000]: offset         54 s2 freq  +12064
dravik-host[8.000]: offset        -51 s2 freq  +11979
pairs       9 in 8.000 s
lock        after 3.000 s, lost 0 times, missed 0 times; 6 of 6 pairs locked since
error       RMS 43.59 ns, peak 76 ns, last -51 ns
            (of the clock against the reference as measured, all pairs since the first lock)
frequency   ordered -12.064 ppm to -11.959 ppm, last -11.979 ppm
host calls  getTime 0, stepTime 1, getFrequency 7, setFrequency 7,
            getMaxFrequencyOffset 1, getMinFrequencyOffset 1
offset_seconds -5.1e-08
frequency_offset -1.19786563e-05
locked 1
holdover_seconds 0
estimated_error_seconds 0
pairs_total 9
locks_lost_total 0
steps_total 1
samples_out_of_date_total 0
samples_unusable_total 0
10
10
pair,8.000000000,1000000008000000000,1000000007999999949,-51,,,
call,8.000000000,,,,,getFrequency,-12064.453125
call,8.000000000,,,,,setFrequency,-11978.65625
== lines now and then | ptp ref errors=readings | --reference phc:ref --interval 1s --duration 22s --config calm.json --status 10s
     1.000 s  frequency measured: +11.970 ppm off, now steered by -11.970 ppm
     2.000 s  stepped by -3.012 ms
     3.000 s  locked, error -10 ns
dravik-host[10.000]: rms 1570890 max 3012069 freq  +10901 +/- 3448
dravik-host[20.000]: rms   44 max   65 freq  +12000 +/-  38
== within --max-step | system | --max-step 4ms --interval 1s --duration 4s
     1.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     2.000 s  stepped by -3.012 ms
     3.000 s  locked, error +0 ns
== beyond --max-step | system | --max-step 2ms --interval 1s --duration 4s
     1.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
dravik-host: refused a step of -3.012 ms: --max-step is 2 ms
exit 1
== backwards beyond it | system | --max-step 2ms --initial-offset -3ms --interval 1s --duration 4s
     1.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
dravik-host: refused a step of +2.988 ms: --max-step is 2 ms
exit 1
== a dry run | system | --dry-run --interval 1s --duration 8s --csv dry | grep -E '^(held|call)' dry; replay dry --re-discipline --config calm.json | grep lock
     1.000 s  frequency measured: +12.000 ppm off, would be steered by -12.000 ppm
     2.000 s  would step by -3.024 ms
     3.000 s  lock missed, error +3.036 ms
     5.000 s  frequency measured: +12.000 ppm off, would be steered by -12.000 ppm
     6.000 s  would step by -3.072 ms
     7.000 s  lock missed, error +3.084 ms
pairs       8 in 7.000 s
lock        never; missed 2 times
frequency   would be ordered -12.000 ppm to -12.000 ppm, last -12.000 ppm
host calls  getTime 0, stepTime 0, getFrequency 2, setFrequency 0,
            getMaxFrequencyOffset 1, getMinFrequencyOffset 1
call,0.000000000,,,,,getMaxFrequencyOffset,500000
call,0.000000000,,,,,getMinFrequencyOffset,-500000
call,1.000000000,,,,,getFrequency,0
held,1.000000000,,,,,setFrequency,-11999.859375
held,2.000000000,,,,,stepTime,-3024000
call,5.000000000,,,,,getFrequency,0
held,5.000000000,,,,,setFrequency,-11999.859375
held,6.000000000,,,,,stepTime,-3072000
replay: dry, 8 measurements from CSV with reference_ns and clock_ns;
     3.000 s  locked, error +0 ns
lock        after 3.000 s, lost 0 times, missed 0 times; 5 of 5 pairs locked since
            (of the clock against the reference as measured, all pairs since the first lock)
== at its limit | system | --max-frequency-offset 10ppm --interval 1s --duration 4s
     1.000 s  frequency at its limit, -10.000 ppm
     3.000 s  frequency at its limit, -10.000 ppm
== measured over a while, twice | ptp ref;at 20s step ref -500us | --reference phc:ref --interval 1s --measure-over 4s --duration 30s
     4.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     5.000 s  stepped by -3.048 ms
     6.000 s  locked, error +0 ns
    20.000 s  lock lost, error +500 us
    25.000 s  frequency measured: +0.000 ppm off, now steered by -12.000 ppm
    26.000 s  stepped by -500 us
    27.000 s  locked, error +0 ns
pairs       30 in 29.000 s; 6 held back
lock        after 6.000 s, lost 1 time, missed 0 times; 17 of 24 pairs locked since
error       RMS 270 us, peak 500 us, last +0 ns
            while locked: RMS 0 ns, peak 0 ns
            (of the clock against the reference as measured, all pairs since the first lock)
frequency   ordered -12.000 ppm to -12.000 ppm, last -12.000 ppm
host calls  getTime 0, stepTime 2, getFrequency 19, setFrequency 19,
            getMaxFrequencyOffset 1, getMinFrequencyOffset 1
WARNING     the lock did not hold: lost 1 time, 30.4 % of the time without it
            Compare the document with the noise: dravik-host check DOCUMENT --interval TIME
            --noise TIME; or design one: dravik-host tune TRACE
== the reference leaps | shm 2 interval=1s;at 5s step 2 3ms | --reference shm:2 --sanity-limit 1000ppm --duration 10s --config calm.json
     2.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     3.000 s  stepped by -3.024 ms
     4.000 s  locked, error +0 ns
     5.000 s  the reference leapt by +3 ms against CLOCK_MONOTONIC_RAW: measuring anew
     6.000 s  frequency measured: +0.000 ppm off, now steered by -12.000 ppm
     7.000 s  stepped by +3 ms
     8.000 s  locked, error +0 ns
== the clock leaps | system | --interval 1s --sanity-limit 1ppb --frequency-error 1100ppm --max-frequency-offset 2000ppm --duration 5s
     1.000 s  the clock leapt by +1.1 ms against CLOCK_MONOTONIC_RAW: measuring anew
     2.000 s  the clock leapt by +1.1 ms against CLOCK_MONOTONIC_RAW: measuring anew
     3.000 s  the clock leapt by +1.1 ms against CLOCK_MONOTONIC_RAW: measuring anew
     4.000 s  the clock leapt by +1.1 ms against CLOCK_MONOTONIC_RAW: measuring anew
== a clock within the limit | system | --interval 1s --sanity-limit 1200ppm --frequency-error 1100ppm --max-frequency-offset 2000ppm --duration 5s
     1.000 s  frequency measured: +1098.791 ppm off, now steered by -1098.791 ppm
     2.000 s  stepped by -4.1 ms
     3.000 s  locked, error +0 ns
== the machine's clock leaps | shm 2 interval=1s;at 5500ms step system 1s | --reference shm:2 --duration 10s --config calm.json
     2.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     3.000 s  stepped by -3.024 ms
     4.000 s  locked, error +0 ns
left out of the reference's samples: 1 out of date, 0 not usable
== silence | shm 2 interval=1s errors=errors;at 20s silence 2;at 60s resume 2;at 70s silence 2;at 119s run cp m m1;at 179s run cp m m2;at 200s resume 2 | --reference shm:2 --config calm.json --duration 205s --holdover-after 5s --remeasure-after 100s --status 30s --metrics m | figures m1 m2 | grep -E '[hd]_'
     2.000 s  frequency measured: +11.970 ppm off, now steered by -11.970 ppm
     3.000 s  stepped by -3.024 ms
     4.000 s  locked, error -10 ns
    24.000 s  reference is silent: holding the frequency
dravik-host[31.000]: holdover for 12 s, error about 478 ns
    60.000 s  reference is back after 41 s
dravik-host[61.000]: rms   66 max   80 freq  +11961 +/-  48
    74.000 s  reference is silent: holding the frequency
dravik-host[91.000]: holdover for 22 s, error about 918.5 ns
dravik-host[121.000]: holdover for 52 s, error about 2.169 us
dravik-host[151.000]: holdover for 82 s, error about 3.42 us
dravik-host[181.000]: holdover for 112 s, error about 4.67 us
   200.000 s  reference is back after 131 s: measuring anew
   201.000 s  frequency measured: +0.037 ppm off, now steered by -12.039 ppm
   202.000 s  no step needed, error -409 ns
   203.000 s  locked, error -389 ns
pairs       34 in 204.000 s
lock        after 4.000 s, lost 1 time, missed 0 times; 28 of 31 pairs locked since
error       RMS 143.2 ns, peak 409 ns, last -40 ns
            while locked: RMS 86.71 ns, peak 389 ns
            (of the clock against the reference as measured, all pairs since the first lock)
frequency   ordered -12.071 ppm to -11.612 ppm, last -11.781 ppm
host calls  getTime 0, stepTime 1, getFrequency 30, setFrequency 31,
            getMaxFrequencyOffset 1, getMinFrequencyOffset 1
WARNING     the lock did not hold: lost 1 time, 1.5 % of the time without it
            Compare the document with the noise: dravik-host check DOCUMENT --interval TIME
            --noise TIME; or design one: dravik-host tune TRACE
estimated_error_seconds 2.04788167e-06
estimated_error_seconds 4.54942595e-06
== seldom, but not silent | system | --interval 150ms --holdover-after 50ms --remeasure-after 60ms --duration 1s
     0.150 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     0.300 s  stepped by -3.002 ms
     0.450 s  locked, error +0 ns
== silent at once | shm 2 interval=1s | --reference shm:2 --holdover-after 500ms --remeasure-after 600ms --duration 3s
     0.500 s  no sample from the reference yet
     1.500 s  reference is silent: holding the frequency
     2.000 s  reference is back after 1 s: measuring anew
     2.500 s  reference is silent: holding the frequency
== documents | at 5s signal HUP;at 6s run echo '{"snapTimeThreshold": 100}' > live.json;at 6s signal HUP;at 7s run echo '{"phaseLockCoefficientC": -10}' > live.json;at 7s signal HUP | --interval 1s --config live.json --no-step-after-lock --duration 30s
     1.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     2.000 s  stepped by -3.012 ms
     3.000 s  locked, error +0 ns
     5.000 s  documents read again
     6.000 s  documents stay as they are: live.json: refused with -52005: snapTimeThreshold is 100, not within 1e-8 to 10 s; applied before it: nothing
     7.000 s  documents read again
     8.000 s  lock lost, error +132 us
    10.000 s  frequency measured: +131.998 ppm off, now steered by -12.000 ppm
dravik-host: refused a step of -396 us after the first lock
exit 1
== a further document | system | --interval 1s --config calm.json --then 3s=live.json --duration 9s
     1.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     2.000 s  stepped by -3.012 ms
     3.000 s  locked, error +0 ns
     6.000 s  tuned by live.json
== SIGINT | at 3500ms signal INT | --interval 1s
     1.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     2.000 s  stepped by -3.012 ms
     3.000 s  locked, error +0 ns
== SIGTERM | shm 2;at 3500ms signal TERM | --reference shm:2
pairs       0 in 0.000 s
lock        never; missed 0 times
frequency   never ordered
host calls  getTime 0, stepTime 0, getFrequency 0, setFrequency 0,
            getMaxFrequencyOffset 1, getMinFrequencyOffset 1
== figures that cannot be written | system | --metrics none/m
dravik-host: cannot write none/m.new: No such file or directory
exit 1
== nor later | at 3s run rm -r folder | --metrics folder/m --interval 1s --duration 6s
     1.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     2.000 s  stepped by -3.012 ms
     3.000 s  locked, error +0 ns
     3.000 s  cannot write folder/m.new: No such file or directory
== figures to a stream | system | --metrics -
dravik-host: --metrics: the figures are replaced as a whole, which takes a file
exit 2
END

# Its lines are a trace.
simulatedHost "ptp ref errors=readings" run --reference phc:ref --duration 9s --config calm.json --status 0 > out
expect "its lines are a trace" 72 "$(replay out | sed -nE 's/^pairs +([0-9]+) .*/\1/p')"

# In real time a run takes its time, shows each line at once, and ends by a signal. Nothing here
# depends on how fast the machine is.
real() { exec ${EMULATOR:+"$EMULATOR"} "$bin/dravik-host" run "$@"; }
start=$EPOCHREALTIME
(real --duration 300ms) > out
expect "real time" "0 1" "$? $((${EPOCHREALTIME/./} - ${start/./} >= 300000))"
mkfifo fifo
last=
real --config calm.json > fifo & pid=$!
while IFS= read -r line; do
    case $line in
    *' frequency measured: '*) kill -HUP $pid ;;
    *' documents read again') kill -TERM $pid ;;
    'host calls '*) last=$line ;;
    esac
done < fifo
wait $pid
expect "real signals" "0 host calls" "$? ${last%%  *}"

echo "$checks checks, $failures failures"
exit $((failures > 0))
