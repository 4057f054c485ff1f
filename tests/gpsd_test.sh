#!/usr/bin/env bash
# Samples of Debian's gpsd, which is fed with a receiver's sentences: what dravik-host takes from the
# segment is what gpsd says that it put there. In namespaces of their own, as in scripts/ptp.
# Usage: gpsd_test.sh FOLDER SCRIPT, the folder of dravik-host and scripts/unpack
set -uo pipefail
PATH+=:/usr/sbin:/sbin
export TZ=UTC

# What a receiver says in a second.
sentences()
{
    local time date sentence sum i byte
    printf -v time '%(%H%M%S)T.00' -1
    printf -v date '%(%d%m%y)T' -1
    for sentence in "GPGGA,$time,4807.038,N,01131.000,E,1,08,0.9,545.4,M,46.9,M,," \
        "GPGSA,A,3,04,05,09,12,24,25,29,31,,,,,2.5,1.3,2.1" \
        "GPRMC,$time,A,4807.038,N,01131.000,E,000.0,084.4,$date,,,A"; do
        sum=0
        for ((i = 0; i < ${#sentence}; ++i)); do
            printf -v byte %d "'${sentence:i:1}"
            ((sum ^= byte))
        done
        printf '$%s*%02X\r\n' "$sentence" "$sum"
    done
}

# The first process of the namespaces, without which none of the others goes on.
inside()
{
    mount -t proc none /proc 2> /dev/null   # sanitizers look there; containers may forbid it
    ip link set dev lo up
    LD_LIBRARY_PATH=$(echo "$gpsd"/usr/lib/*-linux-gnu) "$gpsd/usr/sbin/gpsd" -N -n -D 4 \
        udp://127.0.0.1:5000 &> log &
    while sleep 1; do sentences > /dev/udp/127.0.0.1/5000; done 2> /dev/null &
    mkfifo fifo
    exec 3<> fifo
    "$bin/dravik-host" run --reference shm:0 --initial-offset 0s --frequency-error 0ppb --dry-run \
        --status 0 --csv pairs.csv > fifo & host=$!
    timeout 300 grep --max-count 5 '^dravik-host\[' <&3
    kill -INT $host
    wait $host
}

if [ "$1" == inside ]; then
    inside
    exit
fi

bin=$(cd "$1" && pwd)
support=$(cd "$(dirname "$0")/support" && pwd)
# shellcheck source-path=SCRIPTDIR source=support/expect.sh
source "$support/expect.sh"
test=$(realpath "$0")
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY

isolated=(unshare --user --map-root-user --net --mount --ipc --pid --fork --kill-child)
"${isolated[@]}" true 2> /dev/null || skip "user namespaces are not allowed here"
gpsd=$("$2" gpsd 'lib(gps|usb|bluetooth)') || skip "Debian's package gpsd cannot be fetched"
export bin gpsd
cd "$scratch" || exit 1
"${isolated[@]}" "$test" inside > lines 2> errors
expect "ends well" 0 $?
expect "samples arrive" 5 "$(wc -l < lines)"
# Those that gpsd did not tell of, or with a time that is 1 ms off: the soft clock has the machine's.
expect "they are gpsd's" "enough 0" "$(awk -F'[ ,@]+' '
    FILENAME == "log" && /ntpshm_put/ { split($(NF - 1), put, "."); split($NF, at, ".")
        delay[put[1] put[2]] = (at[1] - put[1]) * 1e9 + at[2] - put[2] }
    FILENAME == "pairs.csv" && $1 == "pair" { ++pairs
        if (!($3 in delay) || $5 - delay[$3] > 1e6 || $5 - delay[$3] < -1e6) ++strange }
    END { print (pairs >= 5 ? "enough" : pairs + 0), strange + 0 }' log pairs.csv)"
[ $failures -eq 0 ] || tail -n 20 lines errors log pairs.csv

echo "$checks checks, $failures failures"
exit $((failures > 0))
