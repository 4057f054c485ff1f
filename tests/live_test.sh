#!/usr/bin/env bash
# Runs from references of every kind and on clocks that the kernel keeps, under a simulated machine;
# in real time only that samples arrive from another process.
# Usage: live_test.sh FOLDER CC, with dravik-host and libdravik.so.1 in the folder
set -uo pipefail
bin=$(cd "$1" && pwd)
support=$(cd "$(dirname "$0")/support" && pwd)
# shellcheck source-path=SCRIPTDIR source=support/expect.sh
source "$support/expect.sh"
# shellcheck source-path=SCRIPTDIR source=support/simulated.sh
source "$support/simulated.sh"
scratch=$(mktemp -d)
unit=
trap '[ -z "$unit" ] || ipcrm -M "$(key)" 2> /dev/null; rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
cd "$scratch" || exit 1
host() { exec ${EMULATOR:+"$EMULATOR"} "$bin/dravik-host" run "$@"; }

# In segments and sockets the machine is 5 ms behind and 100 ppm fast; the clock is 3 ms ahead of it,
# and 12 ppm fast against it.
echo '{"snapTimeThreshold": 1e-3}' > calm.json
echo precious > file
touch unknown
(simulatedHost "sock left;at 1s run kill -9 \$PPID" run --reference sock:left > out) 2> /dev/null
expect "killed" 137 $?
expectRuns << 'END'
== a wide segment | system offset=-5ms frequency=100ppm;shm 2 interval=1s offset=777ns bits=64 | --reference shm:2 --config calm.json --duration 4s --status 0
dravik-host[1.000]: offset   -1888776 s0 freq      +0
     2.000 s  frequency measured: +111.988 ppm off, now steered by -111.988 ppm
dravik-host[2.000]: offset   -1776775 s0 freq +111988
     3.000 s  stepped by +1.776 ms
dravik-host[3.000]: offset   -1775677 s1 freq +111988
== a narrow segment | system offset=-5ms frequency=100ppm;shm 2 interval=1s offset=777ns bits=32 mode=1 | --reference shm:2 --config calm.json --duration 4s --status 0
dravik-host[1.000]: offset   -1888776 s0 freq      +0
     2.000 s  frequency measured: +111.988 ppm off, now steered by -111.988 ppm
dravik-host[2.000]: offset   -1776775 s0 freq +111988
     3.000 s  stepped by +1.776 ms
dravik-host[3.000]: offset   -1775677 s1 freq +111988
== microseconds only | system offset=-5ms frequency=100ppm;shm 2 interval=1s offset=777ns micro=1 | --reference shm:2 --config calm.json --duration 4s --status 0
dravik-host[1.000]: offset   -1887999 s0 freq      +0
     2.000 s  frequency measured: +111.988 ppm off, now steered by -111.988 ppm
dravik-host[2.000]: offset   -1775998 s0 freq +111988
     3.000 s  stepped by +1.775 ms
dravik-host[3.000]: offset   -1774900 s1 freq +111988
== samples of mode 0 | system;shm 2 interval=1s spoilt=leap/old/torn | --reference shm:2 --config calm.json --duration 6s
     4.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     5.000 s  stepped by -3.048 ms
left out of the reference's samples: 1 out of date, 1 not usable
== samples of mode 1 | system;shm 2 interval=1s mode=1 spoilt=leap/old/torn | --reference shm:2 --config calm.json --duration 6s
     5.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
left out of the reference's samples: 1 out of date, 2 not usable
== the first unit is private | shm 0 absent=1;trace trace | --reference shm:0 --duration 1s | cut -d, -f5 trace
event
segment 600
== the second, too | shm 1 absent=1;trace trace | --reference shm:1 --duration 1s | cut -d, -f5 trace
event
segment 600
== others are not | shm 2 absent=1;trace trace | --reference shm:2 --duration 1s | cut -d, -f5 trace
event
segment 666
== its producer comes later | shm 2 absent=1 interval=1s first=2s | --reference shm:2 --config calm.json --duration 6s
     3.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     4.000 s  stepped by -3.036 ms
     5.000 s  locked, error +0 ns
== wide datagrams | system offset=-5ms frequency=100ppm;sock here interval=1s | --reference sock:here --config calm.json --duration 6s | ls here 2>&1
     2.000 s  frequency measured: +111.988 ppm off, now steered by -111.988 ppm
     3.000 s  stepped by +1.776 ms
     4.000 s  locked, error +0 ns
ls: cannot access 'here': No such file or directory
== narrow ones of a pulse | system offset=-5ms frequency=100ppm;sock here interval=1s bits=32 pulse=1 | --reference sock:here --config calm.json --duration 6s
     2.000 s  frequency measured: +111.988 ppm off, now steered by -111.988 ppm
     3.000 s  stepped by +1.776 ms
     4.000 s  locked, error +0 ns
== datagrams of no use | sock here interval=1s spoilt=short/long/magic/leap/old | --reference sock:here --duration 9s
     7.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     8.000 s  stepped by -3.084 ms
left out of the reference's samples: 1 out of date, 4 not usable
== a socket left behind | sock left interval=1s | --reference sock:left --config calm.json --duration 4s
     2.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     3.000 s  stepped by -3.024 ms
== a file of that name | sock file | --reference sock:file --duration 4s | cat file
dravik-host: cannot make the socket file: Address already in use
exit 1
precious
== realtime from ptp | system frequency=100ppm;ptp ptp frequency=-150ppm offset=1000000000s;trace trace | --reference phc:ptp --clock realtime --config calm.json --interval 1s --duration 6s | sed -n 's/.*,//p' trace
     1.000 s  frequency measured: +249.976 ppm off, now steered by -249.976 ppm
     2.000 s  stepped by +1000000000 s
     3.000 s  locked, error -1 ns
event
frequency
frequency
step
frequency
frequency
frequency
== ptp from realtime | system frequency=100ppm;ptp ptp frequency=-150ppm offset=1s;trace trace pace=5s | --reference realtime --clock phc:ptp --config calm.json --interval 1s --duration 6s | cut -d, -f2- trace
     1.000 s  frequency measured: -250.038 ppm off, now steered by +250.038 ppm
     2.000 s  stepped by -999.8 ms
     3.000 s  locked, error +1 ns
clock,error_ns,ordered_ppb,event
ptp,1000000000.000,0.000,frequency
system,0.000,0.000,
ptp,1000000000.000,0.000,
ptp,999850014.998,250038.498,frequency
ptp,199980.992,250038.498,step
ptp,299971.985,250037.399,frequency
ptp,399961.879,250036.865,frequency
ptp,499951.240,250036.316,frequency
system,500000.000,0.000,
ptp,500001.234,250036.316,
== not precise | ptp ptp delay=400ns quirks=e offset=1ms;trace trace | --reference realtime --clock phc:ptp --config calm.json --interval 1s --duration 4s | cut -d, -f2- trace
     1.000 s  frequency measured: +0.000 ppm off, now steered by +0.000 ppm
     2.000 s  stepped by -1 ms
     3.000 s  locked, error +0 ns
clock,error_ns,ordered_ppb,event
ptp,1000000.000,0.000,frequency
ptp,1000000.000,0.000,frequency
ptp,0.000,0.000,step
ptp,0.000,0.000,frequency
== basic | ptp ptp delay=400ns quirks=b offset=1ms;trace trace | --reference realtime --clock phc:ptp --config calm.json --interval 1s --duration 4s | cut -d, -f2- trace
     1.000 s  frequency measured: +0.000 ppm off, now steered by +0.000 ppm
     2.000 s  stepped by -1 ms
     3.000 s  locked, error +0 ns
clock,error_ns,ordered_ppb,event
ptp,1000000.000,0.000,frequency
ptp,1000000.000,0.000,frequency
ptp,0.000,0.000,step
ptp,0.000,0.000,frequency
== an offset of the reference | ptp ptp offset=37s | --reference phc:ptp --clock realtime --config calm.json --interval 1s --duration 4s --reference-offset -37s
     1.000 s  frequency measured: +0.000 ppm off, now steered by +0.000 ppm
     2.000 s  no step needed, error +0 ns
     3.000 s  locked, error +0 ns
== a dry run | system frequency=100ppm;ptp ptp;trace trace | --reference phc:ptp --clock realtime --dry-run --interval 1s --duration 4s | cut -d, -f2- trace
     1.000 s  frequency measured: +99.990 ppm off, would be steered by -99.990 ppm
     2.000 s  would step by -200 us
     3.000 s  lock missed, error +300 us
clock,error_ns,ordered_ppb,event
== readings fail for a while | ptp ptp;at 5500ms silence ptp;at 8500ms resume ptp | --reference phc:ptp --config calm.json --holdover-after 1ms --interval 1s --duration 12s
     1.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     2.000 s  stepped by -3.012 ms
     3.000 s  locked, error +0 ns
     8.000 s  reference is silent: holding the frequency
     9.000 s  reference is back after 4 s
left out of the reference's samples: 0 out of date, 3 not usable
== from the first one on | reading 20ns;ptp ptp;at 90ns silence ptp;at 3500ms resume ptp | --reference phc:ptp --config calm.json --interval 1s --duration 8s
     5.000 s  frequency measured: +12.000 ppm off, now steered by -12.000 ppm
     6.000 s  stepped by -3.06 ms
     7.000 s  locked, error +0 ns
left out of the reference's samples: 0 out of date, 4 not usable
== those of the clock, at first and later | reading 20ns;ptp ptp;at 90ns silence ptp;at 3500ms resume ptp;at 7500ms silence ptp;at 9500ms resume ptp | --clock phc:ptp --interval 1s --duration 12s
     5.000 s  frequency measured: +0.000 ppm off, now steered by +0.000 ppm
     6.000 s  no step needed, error +0 ns
     7.000 s  locked, error +0 ns
left out of the reference's samples: 0 out of date, 6 not usable
== no permission | system quirks=p;ptp ptp | --reference phc:ptp --clock realtime --interval 1s
dravik-host: cannot set the frequency of CLOCK_REALTIME, which takes CAP_SYS_TIME: Operation not permitted
exit 1
== an order that is cut | system quirks=c frequency=100ppm;ptp ptp | --reference phc:ptp --clock realtime --interval 1s
dravik-host: CLOCK_REALTIME took an offset of -10000 ppb for -99990 ppb
exit 1
== one that is refused | ptp ptp quirks=r frequency=100ppm | --reference realtime --clock phc:ptp --interval 1s
dravik-host: cannot set the frequency of ptp: Numerical result out of range
exit 1
== kept within what it takes | ptp ptp quirks=c frequency=100ppm | --reference realtime --clock phc:ptp --max-frequency-offset 10ppm --interval 1s --duration 3s
     1.000 s  frequency at its limit, -10.000 ppm
== within what the device takes | ptp ptp max=50ppm frequency=100ppm | --reference realtime --clock phc:ptp --interval 1s --duration 3s
     1.000 s  frequency at its limit, -50.000 ppm
== not there | system | --reference phc:none
dravik-host: cannot open none: No such file or directory
exit 1
== not a PTP clock | system | --clock phc:unknown
dravik-host: unknown is not a PTP clock: Inappropriate ioctl for device
exit 1
== no place for a socket | system | --reference sock:none/s
dravik-host: cannot make the socket none/s: No such file or directory
exit 1
== no such unit | system | --reference shm:256
dravik-host: --reference: 'shm:256' is not a reference; see --help
exit 2
== no such reference | system | --reference gps
dravik-host: --reference: 'gps' is not a reference; see --help
exit 2
== no such clock | system | --clock phc:
dravik-host: --clock: 'phc:' is not a clock; see --help
exit 2
== itself | system | --clock realtime
dravik-host: --clock: realtime is its own reference
exit 2
== a pace of its own | system | --reference shm:1 --interval 1s
dravik-host: --interval: shm:1 has a pace of its own
exit 2
== not the soft clock | system | --reference shm:1 --clock realtime --initial-offset 1s
dravik-host: --initial-offset: only the soft clock starts as one likes
exit 2
END

# Another run has the socket already.
echo "${EMULATOR:-} '$bin/dravik-host' run --reference sock:here > taken 2>&1; echo \$? >> taken" > try
simulatedHost "sock here;at 1s run sh ./try" run --reference sock:here --duration 2s > out
expect "a socket in use" "dravik-host: cannot make the socket here: Address already in use
1" "$(cat taken)"

# In real time, from another process, however long it takes. Segments are the whole machine's.
"$2" -O1 -o producer "$support/producer.c" || exit 1
key() { printf 0x%08x $((0x4e545030 + unit)); }
unit=$((10 + RANDOM % 240))
while ipcs -m | grep -q "$(key)"; do unit=$((unit % 250 + 2)); done
mkfifo fifo
step=
for reference in "shm:$unit" sock:here; do
    host --reference "$reference" --config calm.json > fifo & pid=$!
    ${EMULATOR:+"$EMULATOR"} ./producer "${reference%:*}" "${reference#*:}" & producer=$!
    while IFS= read -r line; do
        case $line in
        *' stepped by '*) step=${line##* by } ;;
        *' locked, error '*) kill -TERM $pid $producer ;;
        esac
    done < fifo
    wait $pid
    expect "real $reference" "0 +2 ms" "$? $(awk '{ print ($1 > 1.5 && $1 < 2.5 ? "+2" : $1), $2 }' <<< "$step")"
    wait $producer
done
expect "modes of the segment" 666 "$(ipcs -m | awk -v key="$(key)" '$1 == key { print $4 }')"

echo "$checks checks, $failures failures"
exit $((failures > 0))
