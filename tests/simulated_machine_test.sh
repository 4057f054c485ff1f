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

echo "$checks checks, $failures failures"
exit $((failures > 0))
