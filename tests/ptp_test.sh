#!/usr/bin/env bash
# scripts/ptp: a clock held over a network by Debian's ptp4l, in real time. Ends it with Ctrl-C once
# enough was seen.
# Usage: ptp_test.sh FOLDER SCRIPT, the folder of dravik-host
set -uo pipefail
bin=$(cd "$1" && pwd)
support=$(cd "$(dirname "$0")/support" && pwd)
# shellcheck source-path=SCRIPTDIR source=support/expect.sh
source "$support/expect.sh"
scratch=$(mktemp -d)
running=
trap '[ -z "$running" ] || kill -- -"$running"; rm -rf "$scratch"' EXIT
unset DRAVIK_LIBRARY
mkfifo "$scratch/fifo"

# A process group of its own is what a terminal has. It ends by itself where nothing is seen.
DRAVIK_BIN=$bin DRAVIK_PTP_OUT=$scratch/out env --default-signal=INT setsid \
    "$2" 5min --status 0 > "$scratch/fifo" 2> "$scratch/errors" & group=$! running=$!
pairs=0 locked=0
while IFS= read -r line; do
    echo "$line"
    case $line in
    *' locked, error '*) locked=1 ;;
    'dravik-host['*) [ $((pairs += locked)) -ne 100 ] || kill -INT -- -$group ;;
    esac
done < "$scratch/fifo" > "$scratch/lines"
wait $group
status=$? running=
[ $status -ne 77 ] || skip "$(tail -1 "$scratch/errors")"

expect "ends well" 0 $status
expect "the lock holds" 1 "$(grep -c '^lock .* lost 0 times, missed 0 times' "$scratch/lines")"
"$bin/dravik-host" metrics "$scratch/out/ptp.csv" --measured --assert 'rms<20us' > "$scratch/figures" 2>&1
expect "held within 20 us RMS" 0 $?
# As it tries at its start.
expect "the kernel refuses ptp4l" 1 \
    "$(grep -c 'failed to set the clock status: Operation not permitted' "$scratch/out/slave.log")"
expect "a picture" "PNG" "$(head -c 4 "$scratch/out/ptp.png" | tail -c 3)"
expect "nothing left behind" 1 "$(kill -0 -- -$group 2> /dev/null; echo $?)"
[ $failures -eq 0 ] || (cd "$scratch" && tail -n 20 lines errors figures out/*.log)

echo "$checks checks, $failures failures"
exit $((failures > 0))
